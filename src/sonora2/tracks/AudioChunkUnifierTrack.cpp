#include "sonora2/tracks/AudioChunkUnifierTrack.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/tracks/TrackCommands.h"

namespace sonora2::audio {

using common::COpenThreadIndependentCommand;
using common::CSkipToTimeCommand;

CAudioChunkUnifierTrack::CAudioChunkUnifierTrack(const P<common::ISonoraContext>& context,
                                                 const P<IAudioTrack>& track, int frames, int sampleRate,
                                                 int channelCount, int bytesPerSample)
    : m_context(context), m_track(track), m_frames(frames), m_sampleRate(sampleRate),
      m_channelCount(channelCount), m_bytesPerSample(bytesPerSample),
      m_mutex(peru::getMutexFactory()->createMutex()) {}

CAudioChunkUnifierTrack::~CAudioChunkUnifierTrack() = default;

P<CAudioChunkUnifier> CAudioChunkUnifierTrack::makeUnifier() const {
    P<CAudioChunkUnifier> unifier = peru::make<CAudioChunkUnifier>(m_context, m_track);
    unifier->setFormat(m_sampleRate, m_channelCount, m_bytesPerSample);
    return unifier;
}

bool CAudioChunkUnifierTrack::isOpened() {
    peru::CMutexLock lock(m_mutex);
    return m_unifier && m_track->isOpened();
}

void CAudioChunkUnifierTrack::open() {
    peru::CMutexLock lock(m_mutex);
    m_track->open();
    m_unifier = makeUnifier();
}

void CAudioChunkUnifierTrack::close() {
    peru::CMutexLock lock(m_mutex);
    m_unifier.reset();
    m_track->close();
}

P<IAudioChunk> CAudioChunkUnifierTrack::getNextAudioChunk() {
    peru::CMutexLock lock(m_mutex);
    return m_unifier ? m_unifier->getChunk(m_frames) : nullptr;
}

P<peru::IString> CAudioChunkUnifierTrack::getDebugText() {
    return peru::format("CAudioChunkUnifierTrack:  track: %s", m_track->getDebugText());
}

void CAudioChunkUnifierTrack::processCommand(const P<common::ITrackCommand>& command) {
    const P<peru::IString> name = command->getCommandName();
    peru::CMutexLock lock(m_mutex);
    if (name->equals(COpenThreadIndependentCommand::kName)) {
        // Not passed on: opening also creates the unifier, and an inner list would open all its tracks.
        if (P<COpenThreadIndependentCommand>(command)->isClose()) {
            if (isOpened()) close();
        } else if (!isOpened()) {
            open();
        }
    } else if (name->equals(CSkipToTimeCommand::kName)) {
        skipTo(P<CSkipToTimeCommand>(command)->getTime(), command);
    } else {
        m_track->processCommand(command);
    }
}

void CAudioChunkUnifierTrack::skipTo(double listTime, const P<common::ITrackCommand>& command) {
    if (const auto* medium = dynamic_cast<const IMediumTimeTrack*>(m_track.get()))
        m_track->processCommand(peru::make<CSkipToTimeCommand>(medium->getMediumTime(listTime)));
    else
        m_track->processCommand(command);
    // Its partly used chunk belongs to the old position.
    if (m_unifier) m_unifier = makeUnifier();
}

} // namespace sonora2::audio
