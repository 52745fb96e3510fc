#include "sonora2/tracks/AudioTracklist.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/URI.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/tracks/AudioChunkUnifierTrack.h"
#include "sonora2/tracks/MixSamples.h"
#include "sonora2/tracks/TrackCommands.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

namespace sonora2::audio {

namespace {

// Positions are reported in whole milliseconds, so a finer frame would have no effect.
constexpr int kFramerateNum = 1;
constexpr int kFramerateDen = 1000;

constexpr double kGapSeconds = 0.01; // length of a chunk where nothing plays
constexpr double kLastPosition = 1e15;

} // namespace

CAudioTracklist::CAudioTracklist(bool openInThread, const P<common::ISonoraContext>& context, int sampleRate,
                                 int channelCount, int bytesPerSample, int framesPerStep, double startTime,
                                 int sortIndex, const peru::CStringArg& trackId)
    : CTracklist(kFramerateNum, kFramerateDen, sortIndex, openInThread, startTime, context->getLogManager()),
      m_sampleRate(sampleRate), m_channelCount(channelCount), m_bytesPerSample(bytesPerSample),
      m_context(context), m_trackId(peru::CString::fromView(trackId.getView())),
      m_framesPerStep(framesPerStep) {
    constexpr int kMostBytes = std::numeric_limits<int>::max();
    const bool isSound = sampleRate > 0 && channelCount > 0 && bytesPerSample > 0 && framesPerStep > 0 &&
                         channelCount <= kMostBytes / bytesPerSample &&
                         framesPerStep <= kMostBytes / (channelCount * bytesPerSample) &&
                         sampleRate <= kMostBytes / (channelCount * bytesPerSample);
    if (!isSound)
        throw common::CSonoraError(peru::format({"sonora2.CAudioTracklist.format",
                                                 "CAudioTracklist: %d frames per second of %d channels of %d "
                                                 "bytes, %d at a time, are not a sound format"},
                                                sampleRate, channelCount, bytesPerSample, framesPerStep));
}

CAudioTracklist::~CAudioTracklist() = default;

void CAudioTracklist::addTrack(const P<common::ITrack>& track, double start, double end) {
    const P<IAudioTrack> audioTrack = peru::tryCast<IAudioTrack>(track);
    if (!audioTrack)
        throw peru::CError(peru::localize("sonora2.CAudioTracklist.item",
                                          "only IAudioTrack items should be added to a CAudioTracklist!"));
    CTracklist::addTrack(peru::make<CAudioChunkUnifierTrack>(m_context, audioTrack, m_framesPerStep,
                                                             m_sampleRate, m_channelCount, m_bytesPerSample),
                         start, end);
}

void CAudioTracklist::processCommand(const P<common::ITrackCommand>& command) {
    if (command->getCommandName()->equals(common::CEnableTrackCommand::kName) &&
        common::isMeantFor(*command, m_trackId)) {
        const bool enabled = P<common::CEnableTrackCommand>(command)->isEnabled();
        if (m_enabled.exchange(enabled) && !enabled) close();
    }
    CTracklist::processCommand(command);
}

P<peru::IURI> CAudioTracklist::getURI() {
    return peru::make<peru::CURI>("");
}

P<peru::IString> CAudioTracklist::getDebugText() {
    return peru::CString::fromUTF8("CAudioTracklist");
}

bool CAudioTracklist::isOpened() {
    peru::CMutexLock lock(getLock());
    return m_opened;
}

void CAudioTracklist::open() {
    peru::CMutexLock lock(getLock());
    close();
    m_opened = true;
}

void CAudioTracklist::close() {
    peru::CMutexLock lock(getLock());
    m_opened = false;
    m_position = 0;
    m_current.reset();
    closeTracks();
}

P<IAudioChunk> CAudioTracklist::getNextAudioChunk() {
    peru::CMutexLock lock(getLock());
    if (!m_opened || !step()) return nullptr;
    return m_current;
}

int64_t CAudioTracklist::getPositionMs() {
    return static_cast<int64_t>(m_position * 1000 / static_cast<uint64_t>(m_sampleRate));
}

void CAudioTracklist::setPosition(double time) {
    m_position = static_cast<uint64_t>(std::min(std::round(time * m_sampleRate), kLastPosition));
}

void CAudioTracklist::mix(const Entries& active) {
    P<peru::IMemoryBlock> block = active.empty()
                                      ? makeSilence(std::max(static_cast<int>(m_sampleRate * kGapSeconds), 1))
                                      : mixActive(active);
    const auto frames = static_cast<uint64_t>(block->getSize() / getFrameBytes());
    m_current = peru::make<CAudioChunk>(static_cast<double>(m_position) / m_sampleRate, std::move(block));
    m_position += frames;
}

P<peru::IMemoryBlock> CAudioTracklist::mixActive(const Entries& active) {
    P<peru::IMemoryBlock> sum;
    for (const SEntry* entry : active) {
        const P<IAudioChunk> chunk = P<CAudioChunkUnifierTrack>(entry->track)->getNextAudioChunk();
        if (!chunk) continue;
        // The first chunk is the unifier's own copy and becomes the sum; mixing it into zeros changes
        // nothing.
        if (!sum) {
            sum = chunk->getMemoryBlock();
            continue;
        }
        mixSamples(reinterpret_cast<const int16_t*>(chunk->getData()),
                   reinterpret_cast<int16_t*>(sum->getData()), chunk->getSize() / sizeof(int16_t));
    }
    return sum ? sum : makeSilence(m_framesPerStep);
}

P<peru::IMemoryBlock> CAudioTracklist::makeSilence(int frames) {
    const int64_t bytes = frames * getFrameBytes();
    P<peru::IMemoryBlock> block = m_context->getMemoryManager()->getBlock(bytes);
    std::memset(block->getData(), 0, static_cast<size_t>(bytes));
    return block;
}

} // namespace sonora2::audio
