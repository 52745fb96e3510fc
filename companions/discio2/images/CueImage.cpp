#include "CdText.h"
#include "CueSheet.h"
#include "LayoutBuilder.h"

#include <algorithm>
#include <map>

namespace discio {

namespace {

constexpr size_t kMaxSheetBytes = 1 << 20;

const std::map<std::string, ESectorForm, std::less<>> kModes{
    {"MODE1/2048", ESectorForm::data},       {"MODE1/2352", ESectorForm::raw},
    {"MODE2/2048", ESectorForm::data},       {"MODE2/2336", ESectorForm::withSubheader},
    {"MODE2/2352", ESectorForm::raw},        {"CDG", ESectorForm::audioWithSub},
    {"MODE1/2448", ESectorForm::rawWithSub},
};

// A place in the files of the sheet where a track or its pregap starts.
struct SCut {
    int file;
    int32_t time;
    ESectorForm form;
};

class CCueImage {
public:
    explicit CCueImage(const std::string& path)
        : m_path(path), m_sheet(parseCueSheet(CImageFile(path).readAll(kMaxSheetBytes), path)) {}

    SImageLayout read() {
        m_builder.getContents().texts = m_sheet.texts;
        openFiles();
        for (size_t i = 0; i < m_sheet.tracks.size(); ++i) addTrack(i);
        if (!m_sheet.textFile.empty()) {
            const CImageFile packs(resolveName(m_path, m_sheet.textFile));
            addCdText(packs.readAll(kMaxSheetBytes), m_builder.getContents());
        }
        return m_builder.finish();
    }

private:
    struct SSource {
        int file = 0;
        int64_t offset = 0;
        int64_t bytes = 0;
        bool isSwapped = false;
    };

    [[noreturn]] void refuse(const std::string& reason) const {
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, m_path + ": " + reason);
    }

    void openFiles() {
        for (const SCueFile& file : m_sheet.files) {
            SSource source;
            source.file = m_builder.openFile(resolveName(m_path, file.name));
            const CImageFile& opened = m_builder.getFile(source.file);
            source.bytes = opened.getSize();
            if (file.type == "WAVE") {
                const SWaveData data = findWaveData(opened);
                source.offset = data.offset;
                source.bytes = data.bytes;
            } else if (file.type == "MOTOROLA") {
                source.isSwapped = true;
            } else if (file.type != "BINARY") {
                refuse(file.name + " has the type " + file.type + ", which is not supported");
            }
            m_sources.push_back(source);
        }
    }

    ESectorForm getForm(const SCueTrack& track) const {
        if (track.mode == "AUDIO") return ESectorForm::audio;
        const auto found = kModes.find(track.mode);
        if (found == kModes.end()) refuse("the mode " + track.mode + " is not supported");
        return found->second;
    }

    // Appends the blocks of a file from a time to another one, or to its end for -1. The times of a file
    // count sectors, whose size depends on the track that each belongs to.
    void append(int file, int32_t from, int32_t to, ESectorForm form) {
        const SSource& source = m_sources[static_cast<size_t>(file)];
        if (file != m_file) {
            m_file = file;
            m_time = 0;
            m_offset = 0;
        }
        if (from < m_time) refuse("an INDEX is before the previous one");
        const int64_t size = getSectorBytes(form);
        m_offset += (from - m_time) * size; // sectors in front of the first index are skipped
        const int64_t left = std::max<int64_t>(source.bytes - m_offset, 0);
        const int64_t available = (left + size - 1) / size;
        const int64_t count = to < 0 ? available : to - from;
        if (count < 0) refuse("an INDEX is before the previous one");
        if (count > available || available > INT32_MAX)
            refuse(m_builder.getFile(source.file).getPath() + " is shorter than its tracks");
        if (form == ESectorForm::audio && source.isSwapped) form = ESectorForm::audioSwapped;
        m_builder.append(form, static_cast<int32_t>(count), source.file, source.offset + m_offset,
                         std::min(left, count * size));
        m_time = from + static_cast<int32_t>(count);
        m_offset += count * size;
    }

    void addTrack(size_t position) {
        const SCueTrack& track = m_sheet.tracks[position];
        const ESectorForm form = getForm(track);
        STrack added;
        added.number = track.number;
        added.isAudio = isAudioForm(form);
        added.texts = track.texts;
        const auto isFirst = [](const SCueIndex& index) { return index.number == 1; };
        const auto first = std::find_if(track.indices.begin(), track.indices.end(), isFirst);
        if (first == track.indices.end())
            refuse("track " + std::to_string(track.number) + " has no INDEX 01");
        const int32_t before = m_builder.getNext();
        m_builder.append(ESectorForm::silence, track.pregap);
        // From INDEX 00, possibly at the end of the file before, to INDEX 01.
        const SCueIndex& start = track.indices.front();
        if (start.number == 0) {
            append(start.file, start.time, start.file == first->file ? first->time : -1, form);
            for (int file = start.file + 1; file < first->file; ++file) append(file, 0, -1, form);
        }
        if (first->file != m_file && first->time > 0) append(first->file, 0, first->time, form);
        added.start = m_builder.getNext();
        // The pause in front of the first track is not part of the image's blocks.
        added.pregap = added.start - before + (position == 0 ? kLeadInSectors : 0);
        m_builder.getContents().tracks.push_back(added);
        addBody(position, *first, form);
        m_builder.append(ESectorForm::silence, track.postgap);
    }

    // Up to the next track's first index; to the end of the file if that is in another one.
    void addBody(size_t position, const SCueIndex& first, ESectorForm form) {
        const bool isLast = position + 1 == m_sheet.tracks.size();
        if (isLast || m_sheet.tracks[position + 1].indices.empty()) {
            append(first.file, first.time, -1, form);
            for (int file = first.file + 1; isLast && file < static_cast<int>(m_sources.size()); ++file)
                append(file, 0, -1, form);
            return;
        }
        const SCueIndex& next = m_sheet.tracks[position + 1].indices.front();
        if (next.file < first.file) refuse("the tracks are out of order");
        append(first.file, first.time, next.file == first.file ? next.time : -1, form);
        // What stands in the next file before its first index belongs to this track.
        for (int file = first.file + 1; file < next.file; ++file) append(file, 0, -1, form);
        if (next.file > first.file && next.number > 0) return;
        if (next.file > first.file) append(next.file, 0, next.time, form);
    }

    std::string m_path;
    SCueSheet m_sheet;
    CLayoutBuilder m_builder;
    std::vector<SSource> m_sources;
    int m_file = -1;      // the file of the sheet that was appended last
    int32_t m_time = 0;   // in it
    int64_t m_offset = 0; // in its data
};

} // namespace

SImageLayout readCueImage(const std::string& path) {
    return CCueImage(path).read();
}

SImageLayout readIsoImage(const std::string& path) {
    CLayoutBuilder builder;
    const int file = builder.openFile(path);
    const int64_t bytes = builder.getFile(file).getSize();
    // Sectors with headers start with a pattern that no volume has in its unused first bytes.
    char head[16] = {};
    const bool isRaw =
        builder.getFile(file).read(0, head, sizeof head) == sizeof head &&
        std::string_view(head, 12) == std::string_view("\0\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\0", 12);
    const ESectorForm form = isRaw ? ESectorForm::raw : ESectorForm::data;
    const int64_t size = getSectorBytes(form);
    STrack track;
    track.number = 1;
    track.pregap = kLeadInSectors;
    builder.getContents().tracks.push_back(track);
    const int64_t count = (bytes + size - 1) / size;
    if (count > INT32_MAX)
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, path + " is larger than any disc");
    builder.append(form, static_cast<int32_t>(count), file, 0, bytes);
    return builder.finish();
}

} // namespace discio
