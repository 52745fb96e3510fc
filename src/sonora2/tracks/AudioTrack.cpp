#include "sonora2/tracks/AudioTrack.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/LoggedCall.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/tracks/TrackCommands.h"
#include "sonora2/tracks/VolumeRamp.h"

#include <cstring>

namespace sonora2::audio {

using common::COpenThreadIndependentCommand;
using common::CSetAudioEqualizerCommand;
using common::CSkipToTimeCommand;
using Guard = common::CEmbeddedMutex<common::IAudioSource>;

namespace {

constexpr int kSampleBytes = sizeof(int16_t);

} // namespace

CAudioTrack::CAudioTrack(const P<common::ISonoraContext>& context, const P<common::IAudioSource>& source,
                         bool opened, double startTime, double duration, int sortIndex,
                         const P<peru::IURI>& uri, const peru::CStringArg& trackId)
    : m_context(context), m_guard(peru::make<Guard>(source)), m_startTime(startTime), m_duration(duration),
      m_uri(uri), m_opened(opened), m_trackId(peru::CString::fromView(trackId.getView())),
      m_sortIndex(sortIndex) {}

CAudioTrack::~CAudioTrack() {
    if (m_opened) common::callLogged(m_context->getLogManager(), [&] { source().close(); });
}

void CAudioTrack::setFadeTimes(double fadeIn, double fadeOut) {
    m_volumeChanges.clear();
    if (fadeIn > 0.0) addVolumeChange(0.0, 1.0, 0.0, fadeIn);
    if (fadeOut > 0.0) addVolumeChange(1.0, 0.0, m_duration - fadeOut, m_duration);
}

void CAudioTrack::addVolumeChange(double startFactor, double endFactor, double startTime, double endTime) {
    m_volumeChanges.push_back({startFactor, endFactor, startTime, endTime});
}

void CAudioTrack::setEqualizerPreset(int preset) {
    peru::CMutexLock lock(m_guard);
    m_equalizerPreset = preset;
}

void CAudioTrack::setSpeed(double speed) {
    peru::CMutexLock lock(m_guard);
    m_speed = speed;
    m_converter.reset();
}

bool CAudioTrack::isOpened() {
    peru::CMutexLock lock(m_guard);
    return m_opened;
}

void CAudioTrack::open() {
    peru::CMutexLock lock(m_guard);
    source().open();
    m_opened = true;
    m_converter.reset();
    if (m_equalizerPreset != 0) makeEqualizer();
}

void CAudioTrack::makeEqualizer() {
    m_toolsHandler = createAudioToolsHandler();
    m_equalizer = m_toolsHandler ? m_toolsHandler->createEqualizer() : nullptr;
    if (!m_equalizer) {
        m_context->getLogManager()->log(
            common::kSeverityWarning,
            peru::format({"sonora2.CAudioTrack.noAudioTools",
                          "CAudioTrack: no audio tools, equalizer preset %d is ignored"},
                         m_equalizerPreset));
        return;
    }
    m_equalizer->configure(source().getSampleRate(), source().getBytesPerSample(),
                           source().getChannelCount());
    m_equalizer->select(m_equalizerPreset);
}

void CAudioTrack::close() {
    peru::CMutexLock lock(m_guard);
    m_opened = false;
    m_equalizer.reset();
    m_toolsHandler.reset();
    m_converter.reset();
    source().close();
}

P<peru::IString> CAudioTrack::getDebugText() {
    P<peru::IString> effects = peru::CString::empty();
    for (const SVolumeChange& change : m_volumeChanges)
        effects =
            effects + peru::format("\n  VolumeChange: Time: %2.2fs - %2.2fs  Factors %2.2f - %2.2fs",
                                   change.startTime, change.endTime, change.startFactor, change.endFactor);
    if (!m_uri) return peru::format("CAudioTrack: uri: NULL (silent) Effects: %s", effects);
    return peru::format("CAudioTrack: uri: %s Effects: %s", m_uri->getAsString(), effects);
}

int CAudioTrack::getBufferStatus() {
    peru::CMutexLock lock(m_guard);
    return m_opened ? source().getBufferStatus() : 100;
}

int CAudioTrack::getSampleRate() {
    peru::CMutexLock lock(m_guard);
    return source().getSampleRate();
}

int CAudioTrack::getChannelCount() {
    peru::CMutexLock lock(m_guard);
    return source().getChannelCount();
}

int CAudioTrack::getBytesPerSample() {
    peru::CMutexLock lock(m_guard);
    return source().getBytesPerSample();
}

void CAudioTrack::processCommand(const P<common::ITrackCommand>& command) {
    if (!common::isMeantFor(*command, m_trackId)) return;
    const P<peru::IString> name = command->getCommandName();
    peru::CMutexLock lock(m_guard);
    if (name->equals(CSkipToTimeCommand::kName)) {
        const double time = P<CSkipToTimeCommand>(command)->getTime() - m_startTime;
        if (!m_opened || !(time >= 0.0 && time <= m_duration)) return;
        m_converter.reset();
        source().skipToTime(time);
    } else if (name->equals(CSetAudioEqualizerCommand::kName)) {
        m_equalizerPreset = P<CSetAudioEqualizerCommand>(command)->getPreset();
        if (m_equalizer) m_equalizer->select(m_equalizerPreset);
    } else if (name->equals(COpenThreadIndependentCommand::kName)) {
        const bool wantsClosed = P<COpenThreadIndependentCommand>(command)->isClose();
        if (source().isOpened() != wantsClosed) return;
        if (wantsClosed)
            close();
        else
            open();
    }
}

P<IAudioChunk> CAudioTrack::makeSilence() {
    const int64_t bytes =
        int64_t{source().getSampleRate()} * source().getChannelCount() * source().getBytesPerSample();
    P<peru::IMemoryBlock> block = m_context->getMemoryManager()->getBlock(bytes);
    std::memset(block->getData(), 0, static_cast<size_t>(bytes));
    return peru::make<CAudioChunk>(0.0, std::move(block));
}

P<IAudioChunk> CAudioTrack::getNextAudioChunk() {
    peru::CMutexLock lock(m_guard);
    if (!m_opened) return nullptr;
    if (source().isEOF()) return makeSilence();
    P<IAudioChunk> chunk = source().getNextAudioChunk();
    if (!chunk || chunk->getSize() == 0) return chunk;

    const int channels = source().getChannelCount(), rate = source().getSampleRate();
    if (source().getBytesPerSample() == kSampleBytes && channels > 0 && rate > 0) {
        const SRampChunk ramp = {reinterpret_cast<int16_t*>(chunk->getData()),
                                 chunk->getSize() / channels / kSampleBytes, channels, rate,
                                 chunk->getTimestamp()};
        for (const SVolumeChange& change : m_volumeChanges) applyVolumeChange(change, ramp);
    }
    if (m_equalizer) m_equalizer->process(chunk->getData(), chunk->getSize());
    return m_speed != 0.0 ? changeSpeed(chunk) : chunk;
}

P<IAudioChunk> CAudioTrack::changeSpeed(const P<IAudioChunk>& chunk) {
    if (!m_converter) {
        const int rate = source().getSampleRate(), channels = source().getChannelCount(),
                  bytes = source().getBytesPerSample();
        const double played = rate / m_speed;
        if (!(played >= 1.0 && played < (1 << 30)))
            throw common::CSonoraError(
                peru::format({"sonora2.CAudioTrack.speed", "CAudioTrack: %g is no speed"}, m_speed));
        m_converter = peru::make<samplerateconverter::CSampleRateConverter>(
            rate, channels, bytes, static_cast<int>(played), channels, bytes, m_context->getMemoryManager());
    }
    return m_converter->convert(chunk->getData(), static_cast<int>(chunk->getSize()));
}

} // namespace sonora2::audio
