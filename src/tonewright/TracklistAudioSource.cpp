#include "tonewright/TracklistAudioSource.h"

#include "peru/MemoryManager.h"
#include "peru/uri/URI.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/media/SilentAudioSource.h"
#include "sonora2/tracks/AudioTrack.h"
#include "sonora2/tracks/TrackCommands.h"
#include "tonewright/TracklistAudioTrack.h"

#include <algorithm>

namespace tonewright {

using sonora2::CSilentAudioSource;
using sonora2::audio::CAudioTrack;
using sonora2::audio::CAudioTracklist;
using sonora2::audio::IAudioChunk;

namespace {

constexpr int kCachedBlocks = 30;
constexpr int kFramesPerStep = 4000;
constexpr int kSilentBedIndex = -1; // the lane before all others

// Media due in the next seconds are opened on the list's own thread, so that playback does not wait for a
// slow one.
constexpr bool kOpenInThread = true;

} // namespace

CTracklistAudioSource::CTracklistAudioSource(const P<CAudioTracklist>& tracklist) : m_tracklist(tracklist) {}

CTracklistAudioSource::~CTracklistAudioSource() = default;

P<CTracklistAudioSource> CTracklistAudioSource::create(
    const std::vector<P<CTrack>>& tracks, const P<sonora2::common::IPluginHandler>& pluginHandler,
    const P<sonora2::common::ILogManager>& log, int sampleRate, int channelCount, int bytesPerSample) {
    const P<sonora2::common::ISonoraContext> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    context->setMemoryManager(peru::make<peru::CMemoryManager>(kCachedBlocks));
    context->setLogManager(log);
    const P<CAudioTracklist> list = peru::make<CAudioTracklist>(
        kOpenInThread, context, sampleRate, channelCount, bytesPerSample, kFramesPerStep, 0.0, 0);

    double length = 0.0;
    int index = 0;
    for (const P<CTrack>& track : tracks) {
        length = std::max(length, track->getTrackEnd());
        list->addTrack(peru::make<CTracklistAudioTrack>(pluginHandler, track, sampleRate, channelCount,
                                                        bytesPerSample, index++),
                       track->getTrackStart(), track->getTrackEnd());
    }
    const auto silence = peru::make<CSilentAudioSource>(context->getMemoryManager(), length, sampleRate,
                                                        channelCount, bytesPerSample);
    list->addTrack(peru::make<CAudioTrack>(context, silence, false, 0.0, length, kSilentBedIndex), 0.0,
                   length);
    return peru::make<CTracklistAudioSource>(list);
}

P<IAudioChunk> CTracklistAudioSource::fetch() {
    return m_tracklist->hasMore() ? m_tracklist->getNextAudioChunk() : nullptr;
}

void CTracklistAudioSource::open() {
    m_tracklist->open();
    try {
        m_lookAhead = fetch();
    } catch (...) {
        close();
        throw;
    }
    m_opened = true;
}

void CTracklistAudioSource::close() {
    m_lookAhead.reset();
    m_tracklist->close();
    m_opened = false;
}

P<IAudioChunk> CTracklistAudioSource::getNextAudioChunk() {
    P<IAudioChunk> chunk = std::move(m_lookAhead);
    m_lookAhead = fetch();
    return chunk;
}

bool CTracklistAudioSource::isEOF() {
    return !m_lookAhead || !(m_tracklist->getDuration() > m_lookAhead->getTimestamp());
}

void CTracklistAudioSource::skipToTime(double fTimestamp) {
    m_tracklist->processCommand(peru::make<sonora2::common::CSkipToTimeCommand>(fTimestamp));
}

P<peru::IURI> CTracklistAudioSource::getURI() {
    return peru::make<peru::CURI>("");
}

P<peru::IString> CTracklistAudioSource::getPluginName() {
    return peru::CString::fromUTF8("XMLAudioSource");
}

P<sonora2::audio::IAudioStreamInfos> CTracklistAudioSource::getAudioStreamInfos() {
    auto infos = peru::make<sonora2::audio::CAudioStreamInfos>();
    infos->add(
        peru::make<sonora2::audio::CAudioInfo>(0, peru::CString::empty(), peru::CString::fromUTF8("und")));
    return infos;
}

} // namespace tonewright
