#include "projects/VirtualAudioDisc.h"
#include "projects/SegmentReader.h"

#include <algorithm>
#include <string_view>

namespace discio {

namespace {

constexpr int32_t kMaxBlocks = 100 * 60 * kSectorsPerSecond; // of the times in a table of contents
constexpr int32_t kMaxPregap = 5 * 60 * kSectorsPerSecond;
constexpr size_t kMaxCharacters = 160;

bool isUpper(char c) {
    return c >= 'A' && c <= 'Z';
}
bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool isCatalogueNumber(std::string_view text) {
    return text.size() == 13 && std::all_of(text.begin(), text.end(), isDigit);
}

bool isRecordingCode(std::string_view text) {
    return text.size() == 12 && std::all_of(text.begin(), text.begin() + 2, isUpper) &&
           std::all_of(text.begin() + 2, text.begin() + 5, [](char c) { return isUpper(c) || isDigit(c); }) &&
           std::all_of(text.begin() + 5, text.end(), isDigit);
}

void checkText(int32_t text, const std::string& value, bool isTrack) {
    const auto refuse = [&](const char* reason) {
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "\"" + value + "\" " + reason);
    };
    const int32_t last = isTrack ? DISCIO_TEXT_MESSAGE : DISCIO_TEXT_GENRE;
    if ((text < 0 || text > last) && text != DISCIO_TEXT_CODE)
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "text " + std::to_string(text));
    if (std::any_of(value.begin(), value.end(), [](char c) { return (c >= 0 && c < 0x20) || c == 0x7F; }))
        refuse("has a control character");
    const auto continues = [](char c) { return (static_cast<uint8_t>(c) & 0xC0) == 0x80; };
    if (value.size() - static_cast<size_t>(std::count_if(value.begin(), value.end(), continues)) >
        kMaxCharacters)
        refuse("is too long for a text of a disc");
    if (text != DISCIO_TEXT_CODE || value.empty()) return;
    if (isTrack && !isRecordingCode(value)) refuse("is not an ISRC");
    if (!isTrack && !isCatalogueNumber(value)) refuse("is not a catalogue number of 13 digits");
}

} // namespace

SMediumState CVirtualAudioDisc::getState() const {
    SMediumState state;
    state.type = EMediumType::none;
    state.isEmpty = m_segments.empty();
    state.isWritable = true;
    state.capacityBytes = int64_t{m_contents.leadOut} * kDataSectorBytes;
    return state;
}

std::unique_ptr<IAudioReader> CVirtualAudioDisc::createAudioReader(const STrack& track) const {
    const auto index = static_cast<size_t>(track.number) - 1;
    if (index >= m_segments.size() || m_contents.tracks[index].start != track.start ||
        m_contents.tracks[index].length != track.length)
        throw CDiscError(DISCIO_ERROR_DISC_LOST, "the tracks of the project have changed");
    return std::make_unique<CSegmentReader>(m_segments[index].stream, m_segments[index].frames, track);
}

std::string CVirtualAudioDisc::getDataPath() const {
    throw CDiscError(DISCIO_ERROR_NO_DATA, "");
}

size_t CVirtualAudioDisc::requireSegment(int32_t segment) const {
    if (segment < 0 || segment >= static_cast<int32_t>(m_segments.size()))
        throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "track " + std::to_string(segment + 1));
    return static_cast<size_t>(segment);
}

void CVirtualAudioDisc::replaceSegments(std::vector<SSegment> segments) {
    STableOfContents contents;
    contents.texts = m_contents.texts;
    int64_t next = 0;
    for (const SSegment& segment : segments) {
        STrack track;
        track.number = static_cast<int>(contents.tracks.size()) + 1;
        track.isAudio = true;
        track.pregap = track.number == 1 ? kLeadInSectors : segment.pregap;
        next += track.number == 1 ? 0 : segment.pregap;
        track.start = static_cast<int32_t>(next);
        next += (segment.frames + kFramesPerSector - 1) / kFramesPerSector;
        if (next + kLeadInSectors >= kMaxBlocks)
            throw CDiscError(DISCIO_ERROR_NOT_ENOUGH_SPACE, "an audio CD has less than 100 minutes");
        track.length = static_cast<int32_t>(next) - track.start;
        track.texts = segment.texts;
        contents.tracks.push_back(track);
    }
    contents.leadOut = static_cast<int32_t>(next);
    m_contents = std::move(contents);
    m_segments = std::move(segments);
}

void CVirtualAudioDisc::insert(const std::shared_ptr<IPcmStream>& stream, int32_t place) {
    requireIdle();
    const auto count = static_cast<int32_t>(m_segments.size());
    if (place < -1 || place > count)
        throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "place " + std::to_string(place));
    if (count == kMaxTracks) throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "an audio CD has up to 99 tracks");
    if (!stream->isInsertable())
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "a track of a project cannot be inserted into one");
    SSegment segment{stream, 0, kLeadInSectors};
    {
        const CStreamUse use(stream);
        const int32_t channels = use->getChannelCount(), rate = use->getSampleRate();
        if (channels != 2 || rate != kFramesPerSector * kSectorsPerSecond)
            throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, "the source has " + std::to_string(channels) +
                                                                  " channels at " + std::to_string(rate) +
                                                                  " Hz instead of 2 at 44100 Hz");
        segment.frames = use->getFrameCount();
    }
    if (segment.frames <= 0)
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, "the source is empty or of unknown length");
    if (segment.frames >= int64_t{kMaxBlocks} * kFramesPerSector)
        throw CDiscError(DISCIO_ERROR_NOT_ENOUGH_SPACE, "an audio CD has less than 100 minutes");
    std::vector<SSegment> segments = m_segments;
    segments.insert(segments.begin() + (place < 0 ? count : place), std::move(segment));
    replaceSegments(std::move(segments));
}

void CVirtualAudioDisc::remove(int32_t segment) {
    requireIdle();
    std::vector<SSegment> segments = m_segments;
    segments.erase(segments.begin() + static_cast<std::ptrdiff_t>(requireSegment(segment)));
    replaceSegments(std::move(segments));
}

void CVirtualAudioDisc::setPregap(int32_t segment, int32_t blocks) {
    requireIdle();
    const size_t index = requireSegment(segment);
    if (blocks < 0 || blocks > kMaxPregap || (index == 0 && blocks != kLeadInSectors))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "a pregap of " + std::to_string(blocks) + " blocks");
    std::vector<SSegment> segments = m_segments;
    segments[index].pregap = blocks;
    replaceSegments(std::move(segments));
}

void CVirtualAudioDisc::setText(int32_t text, const std::string& value) {
    requireIdle();
    checkText(text, value, false);
    m_contents.texts[static_cast<size_t>(text)] = value;
}

void CVirtualAudioDisc::setSegmentText(int32_t segment, int32_t text, const std::string& value) {
    requireIdle();
    const size_t index = requireSegment(segment);
    checkText(text, value, true);
    m_segments[index].texts[static_cast<size_t>(text)] = value;
    m_contents.tracks[index].texts[static_cast<size_t>(text)] = value;
}

} // namespace discio
