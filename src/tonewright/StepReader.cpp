#include "tonewright/StepReader.h"

#include "peru/Errors.h"
#include "peru/IInterfaceQuery.h"
#include "peru/threads/OrderedParts.h"
#include "sonora2/encoding/SampleReader.h"
#include "sonora2/media/IMediaDescription.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace tonewright {

using sonora2::audio::IAudioChunk;
using sonora2::common::IAudioSource;
using sonora2::common::ITwinSource;

namespace {

constexpr int kStepsPerBlock = 100;
constexpr float kSampleScale = 3.0517578125e-05f; // 1 / 32768
constexpr int kMostThreads = 8;

// A part takes some milliseconds, far more than the skip to its beginning, and its samples some memory.
constexpr int64_t kLeastPartFrames = int64_t{1} << 19;
constexpr int64_t kMostPartFrames = int64_t{1} << 21;
constexpr int64_t kPartsPerFile = 32;
constexpr int64_t kMostPartSamples = 64 * 1024;

void convertFrame(const uint8_t* frame, float* samples, int channels) {
    for (int channel = 0; channel < channels; ++channel, frame += sizeof(int16_t)) {
        int16_t sample;
        std::memcpy(&sample, frame, sizeof sample);
        samples[channel] = static_cast<float>(sample) * kSampleScale;
    }
}

} // namespace

// Reads parts from a source of its own.
class CStepReader::CPartReader {
public:
    CPartReader(P<IAudioSource> source, int channels)
        : m_source(std::move(source)), m_twin(peru::interfaceCast<ITwinSource>(m_source)),
          m_description(peru::interfaceCast<sonora2::common::IMediaDescription>(m_source)),
          m_channels(channels) {}

    void read(int64_t from, int64_t steps, int64_t framesPerStep, SPart& part) noexcept {
        part.samples.clear();
        part.isRead = false;
        try {
            const int64_t end = std::min(from + steps * framesPerStep, m_twin->getFrameCount());
            if (!m_chunk || from < m_chunkStart || from > m_chunkEnd) skipTo(from);
            for (int64_t frame = from; frame < end; frame += framesPerStep) {
                if (!readUntil(frame + 1)) return;
                const size_t offset = static_cast<size_t>(frame - m_chunkStart) * getFrameBytes();
                const size_t known = part.samples.size();
                part.samples.resize(known + static_cast<size_t>(m_channels));
                convertFrame(m_chunk->getData() + offset, &part.samples[known], m_channels);
            }
            part.isRead = readUntil(end) && (!m_description || m_description->takeWarnings()->isEmpty());
        } catch (...) {
            // The source itself finds the same failure.
        }
    }

private:
    size_t getFrameBytes() const { return static_cast<size_t>(m_channels) * sizeof(int16_t); }

    void skipTo(int64_t frame) {
        m_chunk.reset();
        m_twin->skipToFrame(frame);
        m_chunkStart = m_chunkEnd = frame;
    }

    // False if the source ends before that frame.
    bool readUntil(int64_t frame) {
        while (m_chunkEnd < frame) {
            m_chunk = m_source->getNextAudioChunk();
            if (!m_chunk) return false;
            m_chunkStart = m_chunkEnd;
            m_chunkEnd += static_cast<int64_t>(m_chunk->getSize() / getFrameBytes());
        }
        return true;
    }

    P<IAudioSource> m_source;
    P<ITwinSource> m_twin;
    P<sonora2::common::IMediaDescription> m_description;
    int m_channels;
    P<IAudioChunk> m_chunk;
    int64_t m_chunkStart = 0; // frames of the file
    int64_t m_chunkEnd = 0;
};

CStepReader::CStepReader(const P<sonora2::common::ISonoraContext>& context, const P<IAudioSource>& source,
                         int framesPerStep, Receiver receiver)
    : m_context(context), m_source(source), m_channels(source->getChannelCount()),
      m_framesPerStep(framesPerStep), m_rate(source->getSampleRate()), m_receiver(std::move(receiver)) {}

bool CStepReader::read() {
    const auto twin = peru::interfaceCast<ITwinSource>(m_source);
    return (!twin || readParts(*twin)) && readRest();
}

bool CStepReader::deliver(const float* samples) {
    const int64_t lastFrame = (++m_delivered * kStepsPerBlock - 1) * m_framesPerStep;
    return m_receiver({static_cast<double>(lastFrame) / m_rate, samples, m_channels * kStepsPerBlock});
}

std::vector<CStepReader::CPartReader> CStepReader::makeReaders(ITwinSource& source, int count) {
    std::vector<CPartReader> readers;
    try {
        while (static_cast<int>(readers.size()) < count) {
            P<IAudioSource> twin = source.createTwin();
            if (!twin) break;
            readers.emplace_back(std::move(twin), m_channels);
        }
    } catch (const peru::CException&) {
        // Those that exist read all parts.
    }
    return readers;
}

bool CStepReader::readParts(ITwinSource& source) {
    const int64_t start = source.getFrame(), frames = source.getFrameCount() - start;
    const int64_t blockFrames = m_framesPerStep * kStepsPerBlock;
    const int64_t blocks = (frames + m_framesPerStep - 1) / m_framesPerStep / kStepsPerBlock;
    const int64_t wanted = std::clamp(frames / kPartsPerFile, kLeastPartFrames, kMostPartFrames);
    const int64_t most = std::max<int64_t>(kMostPartSamples / (m_channels * kStepsPerBlock), 1);
    const int64_t partBlocks = std::clamp<int64_t>(wanted / blockFrames, 1, most);
    const int64_t count = (blocks + partBlocks - 1) / partBlocks;
    if (count < 2 || partBlocks * blockFrames < kLeastPartFrames / 2) return true;

    const peru::CThreadShare share;
    const peru::CIdleThreads idle(static_cast<int>(std::min<int64_t>(count, kMostThreads)) - 1);
    std::vector<CPartReader> readers = makeReaders(source, idle.getCount() + 1);
    if (readers.empty()) return true;
    std::vector<SPart> window(2 * readers.size());
    bool isFailed = false;
    peru::SOrderedParts parts;
    parts.count = static_cast<size_t>(count);
    parts.window = window.size();
    parts.helpers = static_cast<int>(readers.size()) - 1;
    parts.work = [&](size_t part, int worker) {
        const int64_t first = static_cast<int64_t>(part) * partBlocks;
        readers[static_cast<size_t>(worker)].read(start + first * blockFrames,
                                                  std::min(partBlocks, blocks - first) * kStepsPerBlock,
                                                  m_framesPerStep, window[part % window.size()]);
    };
    parts.deliver = [&](size_t index) {
        const SPart& part = window[index % window.size()];
        isFailed = !part.isRead;
        const size_t blockSize = static_cast<size_t>(m_channels) * kStepsPerBlock;
        for (size_t at = 0; !isFailed && at < part.samples.size(); at += blockSize)
            if (!deliver(&part.samples[at])) return false;
        return !isFailed;
    };
    const bool isComplete = peru::runInOrder(parts);
    source.skipToFrame(start + m_delivered * blockFrames);
    return isComplete || isFailed;
}

bool CStepReader::readRest() {
    auto reader = peru::make<sonora2::common::CSampleReader>(m_context, m_source);
    const size_t blockSize = static_cast<size_t>(m_channels) * kStepsPerBlock;
    const P<peru::IMemoryBlock> block =
        m_context->getMemoryManager()->getBlock(static_cast<int64_t>(blockSize * sizeof(float)));
    auto* samples = reinterpret_cast<float*>(block->getData());
    size_t filled = 0;
    while (reader->hasSamples()) {
        const P<IAudioChunk> chunk = reader->getSamples(static_cast<int>(m_framesPerStep));
        if (!chunk || chunk->getSize() < static_cast<size_t>(m_channels) * sizeof(int16_t)) continue;
        convertFrame(chunk->getData(), samples + filled, m_channels);
        filled += static_cast<size_t>(m_channels);
        if (filled < blockSize) continue;
        if (!deliver(samples)) return false;
        filled = 0;
    }
    return true;
}

} // namespace tonewright
