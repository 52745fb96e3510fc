#include "support/DecoderSource.h"

#include "peru/Errors.h"
#include "sonora2/media/AudioStreamInfos.h"

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <system_error>
#include <utility>

namespace sonora2::plugins {

namespace {

// Long enough for few changes between the threads, and at most this many bytes.
constexpr int64_t kReadAheadChunks = 16;
constexpr int64_t kReadAheadBytes = 768 * 1024;

size_t getReadAheadChunks(const SPcmFormat& format, int chunkFrames) {
    return static_cast<size_t>(
        std::min(kReadAheadChunks, kReadAheadBytes / (int64_t{chunkFrames} * format.frameBytes())));
}

} // namespace

CDecoderSource::CDecoderSource(const P<common::ISonoraContext>& context, const P<peru::IString>& pluginName,
                               const SMediaFile& file, std::unique_ptr<IDecoder> decoder,
                               const SPcmFormat& wanted)
    : m_context(context), m_pluginName(pluginName), m_file(file), m_wanted(wanted),
      m_decoder(std::move(decoder)), m_log(peru::make<CWarningLog>(context->getLogManager())) {
    const P<peru::IString> salvage =
        m_context->getParameter(common::kSalvageParameterKey, common::kSalvageParameter);
    m_salvage = salvage && salvage->equals("1");
}

CDecoderSource::~CDecoderSource() {
    m_readAhead.reset();
    m_producer.reset();
}

void CDecoderSource::open() {
    if (isOpened()) return;
    try {
        openDecoder();
        startProducer(getStartFrame());
    } catch (...) {
        m_producer.reset();
        m_decoder->close(); // also after an open() that threw
        throw;
    }
}

void CDecoderSource::close() {
    if (!isOpened()) return;
    m_readAhead.reset();
    m_peeked.reset();
    m_peekError.reset();
    m_producer.reset();
    m_decoder->close();
    if (!m_media.format.isFloat) return;
    m_media.format = m_delivered = m_integerFormat;
}

void CDecoderSource::skipToTime(double fTimestamp) {
    requireOpened();
    restartAt(toFrame(m_startTime + std::max(fTimestamp, 0.0)));
}

double CDecoderSource::getDuration() {
    if (m_delivered.rate == 0) return 0.0;
    const int64_t start = toFrame(m_startTime);
    if (start == 0) return static_cast<double>(m_media.frames) / m_media.format.rate;
    return static_cast<double>(std::max<int64_t>(m_total - start, 0)) / m_delivered.rate;
}

int CDecoderSource::getBufferStatus() {
    if (!isOpened()) return 0;
    if (isEOF()) return 100;
    return m_readAhead ? m_readAhead->getFill() : 0;
}

bool CDecoderSource::isEOF() {
    if (!isOpened()) return true;
    if (m_media.isEstimate) {
        peekChunk();
        return !m_peeked && !m_peekError;
    }
    if (m_delivering >= m_total) return true;
    return m_readAhead && m_readAhead->isEnded();
}

void CDecoderSource::setStartTime(double fStartTime) {
    if (!(fStartTime >= 0.0))
        fail({"sonora2.CDecoderSource.startTime", "%g is not a start time for %s"}, fStartTime,
             m_file.getDisplayName());
    m_startTime = fStartTime;
    if (isOpened()) restartAt(toFrame(m_startTime));
}

P<audio::IAudioStreamInfos> CDecoderSource::getAudioStreamInfos() {
    auto infos = peru::make<audio::CAudioStreamInfos>();
    int index = 0;
    for (const SSoundtrack& track : m_decoder->getSoundtracks())
        infos->add(peru::make<audio::CAudioInfo>(index++, peru::CString::fromUTF8(track.name),
                                                 peru::CString::fromUTF8(track.language)));
    return infos;
}

void CDecoderSource::setAudioStream(int nAudioIndex) {
    if (nAudioIndex == m_soundtrack) return;
    const bool wasOpened = isOpened();
    if (!wasOpened) open(); // which soundtracks there are is unknown until then
    const bool exists =
        nAudioIndex >= 0 && nAudioIndex < static_cast<int>(m_decoder->getSoundtracks().size());
    const double time = static_cast<double>(m_delivering) / m_delivered.rate;
    if (exists || !wasOpened) close();
    if (!exists)
        fail({"sonora2.CDecoderSource.noSuchStream", "%s has no audio stream %d"}, m_file.getDisplayName(),
             nAudioIndex);
    m_decoder->selectSoundtrack(nAudioIndex);
    m_soundtrack = nAudioIndex;
    if (!wasOpened) return;
    open();
    restartAt(toFrame(time));
}

void CDecoderSource::setSalvage(bool salvage) {
    change(m_salvage, salvage);
}

void CDecoderSource::setClippingPrevention(bool prevent) {
    change(m_preventClipping, prevent);
}

void CDecoderSource::change(bool& option, bool value) {
    if (value == option) return;
    const bool reopen = isOpened();
    close();
    option = value;
    if (reopen) open();
}

SDecoderOptions CDecoderSource::getOptions() const {
    return {m_salvage, m_preventClipping, m_log};
}

bool CDecoderSource::canUseFloat(int bytesPerSample) {
    return isOpened() && bytesPerSample > 0 && m_media.floatBytes == bytesPerSample &&
           m_wanted == SPcmFormat();
}

void CDecoderSource::useFloat(int bytesPerSample) {
    if (!canUseFloat(bytesPerSample))
        fail({"sonora2.CDecoderSource.noFloat", "%s cannot be read as floating-point samples of %d bits"},
             m_file.getDisplayName(), bytesPerSample * 8);
    m_readAhead.reset();
    m_media.format.bytesPerSample = bytesPerSample;
    m_media.format.isFloat = true;
    m_delivered = m_media.format;
    try {
        m_decoder->deliverFloat();
        m_decoder->seek(0); // where a new producer begins
        startProducer(m_delivering);
    } catch (...) {
        close();
        throw;
    }
}

P<peru::IString> CDecoderSource::getCodecName() {
    return peru::CString::fromUTF8(m_media.codec);
}

P<peru::IString> CDecoderSource::takeWarnings() {
    return peru::CString::fromUTF8(m_log->takeWarnings());
}

int64_t CDecoderSource::getBitRate() {
    std::error_code error;
    const uintmax_t bytes = std::filesystem::file_size(m_file.path, error);
    if (error || m_media.frames <= 0) return 0;
    return std::llround(static_cast<double>(bytes) * 8.0 * m_media.format.rate /
                        static_cast<double>(m_media.frames));
}

void CDecoderSource::skipToFrame(int64_t frame) {
    requireOpened();
    restartAt(std::clamp<int64_t>(frame, 0, m_total));
}

P<common::IAudioSource> CDecoderSource::createTwin() {
    requireOpened();
    if (m_salvage || m_soundtrack != 0 || m_media.isEstimate || m_media.isDirect || m_media.format.isFloat)
        return nullptr;
    std::unique_ptr<IDecoder> decoder = m_decoder->createTwin();
    if (!decoder) return nullptr;
    auto twin = peru::make<CDecoderSource>(m_context, m_pluginName, m_file, std::move(decoder), m_delivered);
    twin->m_log = peru::make<CWarningLog>(nullptr);
    twin->m_salvage = false;
    twin->m_preventClipping = m_preventClipping;
    twin->m_isTwin = true;
    twin->open();
    // Otherwise the file has been replaced.
    const bool isSame = twin->m_media.format == m_media.format && twin->m_total == m_total;
    return isSame ? twin : nullptr;
}

P<audio::IAudioChunk> CDecoderSource::getNextAudioChunk() {
    requireOpened();
    if (isEOF()) return nullptr;
    if (m_peekError) std::exchange(m_peekError, nullptr)->raise();
    P<audio::IAudioChunk> chunk = m_peeked ? std::move(m_peeked) : pullChunk();
    if (chunk) m_delivering += chunk->getSize() / static_cast<uint32_t>(m_delivered.frameBytes());
    return chunk;
}

// Where the length is an estimate, only the next chunk tells whether there is one.
void CDecoderSource::peekChunk() {
    if (m_peeked || m_peekError) return;
    try {
        m_peeked = pullChunk();
    } catch (const peru::CException& error) {
        m_peekError = error.clone();
    }
    if (m_peeked || m_peekError || m_delivering == m_total || m_isBehindEnd) return;
    // Now the length is known.
    m_total = m_delivering;
    m_media.frames = std::llround(static_cast<double>(m_total) * m_media.format.rate / m_delivered.rate);
}

P<audio::IAudioChunk> CDecoderSource::pullChunk() {
    if (!m_readAhead) {
        const bool isDirect = m_media.isDirect || m_isTwin;
        m_readAhead = std::make_unique<CReadAhead>(
            *m_producer, isDirect ? 0 : getReadAheadChunks(m_delivered, m_producer->getChunkFrames()));
    }
    return m_readAhead->next();
}

void CDecoderSource::openDecoder() {
    m_media = m_decoder->open(getOptions());
    m_integerFormat = m_media.format;
    const SPcmFormat& own = m_media.format;
    const bool sound = own.rate > 0 && own.channels > 0 && own.bytesPerSample >= 1 &&
                       own.bytesPerSample <= 4 && m_media.frames >= 0;
    if (!sound)
        fail({"sonora2.CDecoderSource.noSound", "%s: %d channels at %d Hz are not a sound format"},
             m_file.getDisplayName(), own.channels, own.rate);
    chooseFormat(m_wanted);
}

// Zeros stand for the file's own values.
void CDecoderSource::chooseFormat(const SPcmFormat& wanted) {
    const SPcmFormat& own = m_media.format;
    const auto choose = [](int value, int ownValue) { return value > 0 ? value : ownValue; };
    const SPcmFormat delivered{choose(wanted.rate, own.rate), choose(wanted.channels, own.channels),
                               choose(wanted.bytesPerSample, own.bytesPerSample)};
    CChunkProducer::requireDeliverable(m_file, own, delivered);
    m_delivered = delivered;
    m_total = CChunkProducer::countDelivered(m_media, m_delivered);
}

void CDecoderSource::startProducer(int64_t frame) {
    m_producer =
        std::make_unique<CChunkProducer>(m_context, m_file, *m_decoder, m_media, m_delivered, getOptions());
    restartAt(frame);
}

void CDecoderSource::setDeliveredFormat(int sampleRate, int channelCount, int bytesPerSample) {
    const SPcmFormat wanted{sampleRate, channelCount, bytesPerSample};
    if (m_media.format.isFloat) { // only while open
        close();
        m_wanted = wanted;
        return open();
    }
    if (isOpened()) {
        chooseFormat(wanted);
        m_readAhead.reset();
        m_decoder->seek(0); // where a new producer begins
        startProducer(getStartFrame());
    }
    m_wanted = wanted;
}

void CDecoderSource::requireOpened() const {
    if (!m_producer)
        fail({"sonora2.CDecoderSource.notOpened", "%s is not opened for reading"}, m_file.getDisplayName());
}

int64_t CDecoderSource::toFrame(double seconds) const {
    // The time of a frame maps back to that frame despite rounding; times in between map to the next frame.
    const double frame = seconds * m_delivered.rate;
    if (!(frame > 0.0)) return 0;
    if (frame >= static_cast<double>(m_total))
        return m_media.isEstimate ? std::llround(std::min(frame, 1e12)) : m_total;
    const double nearest = std::nearbyint(frame);
    return static_cast<int64_t>(std::fabs(frame - nearest) < 1e-3 ? nearest : std::ceil(frame));
}

void CDecoderSource::restartAt(int64_t frame) {
    m_readAhead.reset();
    m_peeked.reset();
    m_peekError.reset();
    m_isBehindEnd = m_media.isEstimate && frame >= m_total; // perhaps
    m_delivering = m_total;                                 // at the end if the seek fails
    m_producer->setOrigin(toFrame(m_startTime));
    m_producer->seek(frame);
    m_delivering = frame;
}

} // namespace sonora2::plugins
