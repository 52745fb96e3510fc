#include "host_support/HostSource.h"

#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/URI.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/AudioStreamInfos.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace tonewright::host_support {

namespace {

constexpr int64_t kChunkFrames = 4608;

} // namespace

void SHostSamples::check() const {
    if (rate >= 1 && channels >= 1 && channels <= 1024 && bytesPerSample >= 1 && bytesPerSample <= 4 &&
        frames >= -1)
        return;
    throw peru::CError(peru::format(
        {"tonewright.HostSource.format", "%d Hz, %d channels and %d bytes per sample are not a sound format"},
        rate, channels, bytesPerSample));
}

CHostSource::CHostSource(const SHostSamples& format, Read read, Seek seek)
    : m_format(format), m_read(std::move(read)), m_seek(std::move(seek)),
      m_memory(peru::make<peru::CMemoryManager>()) {}

CHostSource::~CHostSource() = default;

void CHostSource::open() {
    if (m_isOpened) return;
    if (m_position != m_start) moveTo(m_start);
    m_hasEnded = false;
    m_isOpened = true;
}

void CHostSource::skipToTime(double fTimestamp) {
    if (!m_isOpened)
        throw sonora2::common::CSonoraError(
            peru::localize("tonewright.HostSource.notOpened", "The source is not open"));
    moveTo(m_start + toFrame(fTimestamp));
    m_hasEnded = m_format.frames >= 0 && m_position >= m_format.frames;
}

double CHostSource::getDuration() {
    return static_cast<double>(std::max<int64_t>(m_format.frames - m_start, 0)) / m_format.rate;
}

void CHostSource::setStartTime(double fStartTime) {
    m_start = toFrame(fStartTime);
    if (!m_isOpened) return;
    moveTo(m_start);
    m_hasEnded = false;
}

double CHostSource::getStartTime() {
    return static_cast<double>(m_start) / m_format.rate;
}

P<peru::IURI> CHostSource::getURI() {
    return peru::make<peru::CURI>(peru::CString::empty());
}

P<peru::IString> CHostSource::getPluginName() {
    return peru::CString::fromUTF8("host");
}

P<sonora2::audio::IAudioStreamInfos> CHostSource::getAudioStreamInfos() {
    auto infos = peru::make<sonora2::audio::CAudioStreamInfos>();
    infos->add(peru::make<sonora2::audio::CAudioInfo>(0));
    return infos;
}

void CHostSource::setAudioStream(int nAudioIndex) {
    if (nAudioIndex != 0)
        throw sonora2::common::CSonoraError(
            peru::localize("tonewright.HostSource.oneStream", "The source has one audio stream"));
}

P<sonora2::audio::IAudioChunk> CHostSource::getNextAudioChunk() {
    if (isEOF()) return nullptr;
    const int frameBytes = m_format.channels * m_format.bytesPerSample;
    P<peru::IMemoryBlock> block = m_memory->getBlock(kChunkFrames * frameBytes);
    const int64_t wanted =
        m_format.frames < 0 ? kChunkFrames : std::min(kChunkFrames, m_format.frames - m_position);
    const int64_t read = wanted > 0 ? m_read(block->getData(), wanted) : 0;
    if (read < 0 || read > wanted)
        throw sonora2::common::CSonoraError(
            peru::localize("tonewright.HostSource.read", "The host could not deliver samples"));
    block->setSize(read * frameBytes);
    const double time = static_cast<double>(m_position - m_start) / m_format.rate;
    m_position += read;
    m_hasEnded = read == 0 || (m_format.frames >= 0 && m_position >= m_format.frames);
    if (read == 0) return nullptr;
    return peru::make<sonora2::audio::CAudioChunk>(time, block);
}

int64_t CHostSource::toFrame(double seconds) const {
    const double frame = std::ceil(seconds * m_format.rate - 1e-3);
    const double last = static_cast<double>(m_format.frames < 0 ? INT64_C(1) << 52 : m_format.frames);
    return frame > 0 ? static_cast<int64_t>(std::min(frame, last)) : 0;
}

void CHostSource::moveTo(int64_t frame) {
    if (!m_seek || !m_seek(frame))
        throw sonora2::common::CSonoraError(
            peru::format({"tonewright.HostSource.seek", "The host's source cannot start at %g seconds"},
                         static_cast<double>(frame) / m_format.rate));
    m_position = frame;
}

} // namespace tonewright::host_support
