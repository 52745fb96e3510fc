#include "tonewright/TracklistAudioTrack.h"

#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/uri/URI.h"
#include "sonora2/tracks/TrackCommands.h"
#include "tonewright/ReasonedError.h"
#include "tonewright/TrackModifierFade.h"

#include <algorithm>

namespace tonewright {

using sonora2::audio::IAudioChunk;
using sonora2::common::CSkipToTimeCommand;
using sonora2::common::IAudioSource;

namespace {

constexpr int64_t kSampleBytes = sizeof(int16_t);

int16_t scale(int16_t sample, float gain) {
    const float product = static_cast<float>(sample) * gain;
    if (product < -32768.0F) return -32768;
    if (product > 32767.0F) return 32767;
    return product == product ? static_cast<int16_t>(product) : int16_t{0}; // NaN becomes silence
}

} // namespace

CTracklistAudioTrack::CTracklistAudioTrack(const P<sonora2::common::IPluginHandler>& pluginHandler,
                                           const P<CTrack>& track, int sampleRate, int channelCount,
                                           int bytesPerSample, int index)
    : m_track(track), m_pluginHandler(pluginHandler), m_sampleRate(sampleRate), m_channelCount(channelCount),
      m_bytesPerSample(bytesPerSample), m_index(index) {}

CTracklistAudioTrack::~CTracklistAudioTrack() = default;

P<peru::IURI> CTracklistAudioTrack::getURI() {
    return peru::make<peru::CURI>("");
}

P<peru::IString> CTracklistAudioTrack::getDebugText() {
    return peru::CString::fromUTF8("CTrack");
}

void CTracklistAudioTrack::open() {
    const P<peru::IURI> uri = m_track->getURI();
    sonora2::common::clearLastFailure();
    const P<IAudioSource> source =
        m_pluginHandler->createAudioSource(uri, m_sampleRate, m_channelCount, m_bytesPerSample, true);
    if (!source)
        throw CReasonedError(peru::format({"tonewright.CTracklistAudioTrack.open",
                                           "could not open source in CTracklistAudioTrack: %s"},
                                          uri->getAsString()),
                             sonora2::common::getLastFailure());
    source->skipToTime(m_track->getSourceStartTime());
    m_source = source;
}

void CTracklistAudioTrack::close() {
    const P<IAudioSource> source = std::move(m_source);
    if (source && source->isOpened()) source->close();
}

void CTracklistAudioTrack::processCommand(const P<sonora2::common::ITrackCommand>& command) {
    if (!command->getCommandName()->equals(CSkipToTimeCommand::kName)) return;
    const P<CSkipToTimeCommand> skip(command);
    if (m_source) m_source->skipToTime(skip->getTime());
}

double CTracklistAudioTrack::getMediumTime(double listTime) const {
    return listTime - m_track->getTrackStart() + m_track->getSourceStartTime();
}

P<IAudioChunk> CTracklistAudioTrack::getNextAudioChunk() {
    if (!m_source || m_source->isEOF()) return nullptr;
    const P<IAudioChunk> chunk = m_source->getNextAudioChunk();
    if (!chunk) return nullptr;
    for (int32_t i = 0; i < m_track->getModifierCount(); ++i)
        if (const auto fade = peru::tryCast<CTrackModifierFade>(m_track->getModifierAt(i)))
            applyFade(*fade, *chunk);
    return chunk;
}

void CTracklistAudioTrack::applyFade(const CTrackModifierFade& fade, IAudioChunk& chunk) const {
    const double chunkStart = chunk.getTimestamp();
    const double chunkLength =
        static_cast<double>(chunk.getSize()) / m_sampleRate / m_channelCount / m_bytesPerSample;
    const double fadeBegin = m_track->getSourceStartTime() + fade.getTimestamp();
    const double fadeEnd = m_track->getSourceStartTime() + fade.getTimestamp() + fade.getDuration();
    if (!(fadeBegin <= chunkStart && chunkStart + chunkLength <= fadeEnd)) return;

    const float delta = static_cast<float>(fade.getEndValue()) - static_cast<float>(fade.getStartValue());
    const auto step = static_cast<float>(1.0 / m_sampleRate);
    auto t = static_cast<float>(chunkStart - fadeBegin);
    const int64_t frameBytes = m_channelCount * std::max<int64_t>(m_bytesPerSample, kSampleBytes);
    auto* sample = reinterpret_cast<int16_t*>(chunk.getData());
    for (int64_t frame = chunk.getSize() / frameBytes; frame > 0; --frame, t += step) {
        const auto gain =
            static_cast<float>(static_cast<double>(t) / fade.getDuration() * delta + fade.getStartValue());
        for (int channel = 0; channel < m_channelCount; ++channel, ++sample) *sample = scale(*sample, gain);
    }
}

} // namespace tonewright
