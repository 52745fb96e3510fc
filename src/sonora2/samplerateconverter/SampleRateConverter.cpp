#include "sonora2/samplerateconverter/SampleRateConverter.h"

#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/samplerateconverter/ChannelConverters.h"
#include "sonora2/samplerateconverter/IResampler.h"
#include "sonora2/samplerateconverter/SampleWidths.h"

#include <cstring>
#include <new>
#include <utility>

namespace sonora2::samplerateconverter {

using peru::IMemoryBlock;

namespace {

constexpr int kMaxChannels = CSampleRateConverter::CChannelConverter::kMaxChannels;
constexpr int kNarrow = sizeof(int16_t); // bytes of a sample inside the converter
constexpr int kWide = sizeof(int32_t);
constexpr int kMaxRate = 1 << 24; // far above any real rate; bounds the memory of a flush

constexpr int kFilterSize = 16;
constexpr int kPhaseShift = 10;
constexpr int kLinear = 0;
constexpr double kCutoff = 1.0;

template <class Sample = int16_t> Sample* samplesOf(const P<IMemoryBlock>& block) {
    return reinterpret_cast<Sample*>(block->getData());
}

} // namespace

struct CSampleRateConverter::SImpl {
    struct SChannel {
        P<IMemoryBlock> input; // for the filter, carry-over first
        int carryBytes = 0;    // bytes of the input consumed by the last call
        int carrySamples = 0;  // samples left for the next call
        P<IResampler> resampler;
        P<IMemoryBlock> output; // during one call
        int produced = 0;
    };

    P<peru::IMemoryManager> memoryManager;
    double startTime = -1.0;
    bool useStartTime = false;
    int srcRate, srcChannels, srcBytes;
    int dstRate, dstChannels, dstBytes;
    bool planarOutput;
    int sampleBytes; // kNarrow, or kWide where the output is wider
    uint32_t outputPosition = 0;
    P<CChannelConverter> matrix; // set by the first conversion
    std::array<SChannel, kMaxChannels> channels;

    void prepare();
    P<IMemoryBlock> makeSilence();
    P<IMemoryBlock> widen(const uint8_t* bytes, int frames);
    void split(const void* pcm, int frames);
    void resample(SChannel& channel);
    template <class Sample> P<IMemoryBlock> order(int frames);
    P<IMemoryBlock> assemble(int frames);
};

// Rejects unsupported formats at the first conversion, not earlier: a converter may never be used.
void CSampleRateConverter::SImpl::prepare() {
    if (srcBytes < 1 || srcBytes > 4)
        throw peru::CError(
            peru::format({"sonora2.CSampleRateConverter.source",
                          "CSampleRateConverter: could not convert samples to short SrcBytesPerSample %d"},
                         srcBytes));
    P<CChannelConverter> found = CChannelConverter::create(srcChannels, dstChannels);
    if (!found)
        throw peru::CError(
            peru::format({"sonora2.CSampleRateConverter.channels",
                          "CSampleRateConverter: no suitable ChannelConversion found for %d -> %d"},
                         srcChannels, dstChannels));
    if (dstBytes < 1 || dstBytes > 4)
        throw peru::CError(
            peru::format({"sonora2.CSampleRateConverter.destination",
                          "CSampleRateConverter: could not convert samples from short DstBytesPerSample %d"},
                         dstBytes));
    for (int i = 0; i < dstChannels; ++i) {
        SChannel& channel = channels[i];
        if (srcRate <= kMaxRate && dstRate <= kMaxRate)
            channel.resampler = getResamplerLibrary()->create(dstRate, srcRate, kFilterSize, kPhaseShift,
                                                              kLinear, kCutoff, sampleBytes);
        if (!channel.resampler)
            throw peru::CError(
                peru::format({"sonora2.CSampleRateConverter.filter",
                              "CSampleRateConverter: no filter could be made for %d -> %d frames per second"},
                             srcRate, dstRate));
        channel.input = memoryManager->getBlock(0);
    }
    matrix = std::move(found);
}

P<IMemoryBlock> CSampleRateConverter::SImpl::makeSilence() {
    const int64_t size = int64_t{srcBytes} * srcChannels * srcRate;
    const P<IMemoryBlock> block = memoryManager->getBlock(size);
    // Unsigned samples are silent at mid-scale: zero bytes would be a full-scale click.
    std::memset(block->getData(), srcBytes == 1 ? 0x80 : 0, static_cast<size_t>(size));
    return block;
}

P<IMemoryBlock> CSampleRateConverter::SImpl::widen(const uint8_t* bytes, int frames) {
    const int64_t samples = int64_t{frames} * srcChannels;
    P<IMemoryBlock> block = memoryManager->getBlock(samples * sampleBytes);
    if (sampleBytes == kWide)
        widenToInt(bytes, srcBytes, samples, samplesOf<int32_t>(block));
    else
        widenToShort(bytes, srcBytes, samples, samplesOf(block));
    return block;
}

void CSampleRateConverter::SImpl::split(const void* pcm, int frames) {
    CChannelConverter::PlanePointers planes{};
    CChannelConverter::WidePlanePointers widePlanes{};
    for (int i = 0; i < dstChannels; ++i) {
        SChannel& channel = channels[i];
        const int64_t carry = channel.input->getSize() - channel.carryBytes;
        const int64_t added = int64_t{frames} * sampleBytes;
        P<IMemoryBlock> block = memoryManager->getBlock(carry + added);
        if (carry > 0)
            std::memcpy(block->getData(), channel.input->getData() + channel.carryBytes,
                        static_cast<size_t>(carry));
        uint8_t* plane = block->getData() + carry;
        planes[i] = reinterpret_cast<int16_t*>(plane);
        widePlanes[i] = reinterpret_cast<int32_t*>(plane);
        if (!matrix->isPlaneWritten(i) && added > 0) std::memset(plane, 0, static_cast<size_t>(added));
        channel.input = std::move(block);
        channel.carryBytes = 0;
    }
    if (sampleBytes == kWide)
        return matrix->convertWide(frames, static_cast<const int32_t*>(pcm), widePlanes);
    CChannelConverter::SourcePointers source{};
    for (int i = 0; i < srcChannels; ++i) source[i] = static_cast<const int16_t*>(pcm) + i;
    matrix->convert(frames, source, srcChannels * kNarrow, planes);
}

void CSampleRateConverter::SImpl::resample(SChannel& channel) {
    const int samples = static_cast<int>(channel.input->getSize() / sampleBytes);
    channel.output = memoryManager->getBlock(int64_t{kMaxOutputFrames} * sampleBytes);
    int consumed = 0;
    channel.produced = channel.resampler->run(channel.output->getData(), channel.input->getData(), &consumed,
                                              samples, kMaxOutputFrames);
    if (channel.produced < 0) throw std::bad_alloc();
    channel.carrySamples = samples - consumed;
    channel.carryBytes = consumed * sampleBytes;
    // Usually nothing is left over: return the block to the pool before the next chunk needs one.
    if (channel.carrySamples == 0) {
        channel.input = memoryManager->getBlock(0);
        channel.carryBytes = 0;
    }
}

// The planes' samples in the order of the output.
template <class Sample> P<IMemoryBlock> CSampleRateConverter::SImpl::order(int frames) {
    const P<IMemoryBlock> ordered = memoryManager->getBlock(int64_t{sampleBytes} * dstChannels * frames);
    if (planarOutput) {
        for (int i = 0; i < dstChannels; ++i)
            std::memcpy(samplesOf<Sample>(ordered) + int64_t{i} * frames, channels[i].output->getData(),
                        static_cast<size_t>(frames) * sizeof(Sample));
    } else {
        std::array<const Sample*, kMaxChannels> planes{};
        for (int i = 0; i < dstChannels; ++i) planes[i] = samplesOf<Sample>(channels[i].output);
        interleave(planes, dstChannels, frames, samplesOf<Sample>(ordered));
    }
    return ordered;
}

P<IMemoryBlock> CSampleRateConverter::SImpl::assemble(int frames) {
    const P<IMemoryBlock> ordered = sampleBytes == kWide ? order<int32_t>(frames) : order<int16_t>(frames);
    if (dstBytes == sampleBytes) return ordered;
    const int64_t samples = int64_t{dstChannels} * frames;
    const P<IMemoryBlock> block = memoryManager->getBlock(samples * dstBytes);
    if (dstBytes == 1)
        narrowToByte(samplesOf(ordered), samples, block->getData());
    else
        narrowTo24(samplesOf<int32_t>(ordered), samples, block->getData());
    return block;
}

CSampleRateConverter::CSampleRateConverter(int srcRate, int srcChannels, int srcBytes, int dstRate,
                                           int dstChannels, int dstBytes,
                                           const P<peru::IMemoryManager>& memoryManager, bool planarOutput)
    : m_impl(std::make_unique<SImpl>()) {
    m_impl->memoryManager = memoryManager ? memoryManager : peru::make<peru::CMemoryManager>();
    m_impl->srcRate = srcRate;
    m_impl->srcChannels = srcChannels;
    m_impl->srcBytes = srcBytes;
    m_impl->dstRate = dstRate;
    m_impl->dstChannels = dstChannels;
    m_impl->dstBytes = dstBytes;
    m_impl->planarOutput = planarOutput;
    m_impl->sampleBytes = dstBytes > kNarrow ? kWide : kNarrow;
}

CSampleRateConverter::~CSampleRateConverter() = default;

bool CSampleRateConverter::canConvert(int srcChannels, int dstChannels) {
    return CChannelConverter::exists(srcChannels, dstChannels);
}

void CSampleRateConverter::setStartTime(double startTime) {
    m_impl->startTime = startTime;
    m_impl->useStartTime = true;
}

uint32_t CSampleRateConverter::getOutputPosition() const {
    return m_impl->outputPosition;
}

P<audio::IAudioChunk> CSampleRateConverter::convert(const void* data, int size) {
    if (size < 0) throw peru::CInvalidArgError("size", "CSampleRateConverter::convert");
    SImpl& s = *m_impl;
    if (!s.matrix) s.prepare();

    const uint8_t* bytes = static_cast<const uint8_t*>(data);
    int64_t byteCount = size;
    P<IMemoryBlock> silence;
    if (!data || size == 0) {
        silence = s.makeSilence();
        bytes = silence->getData();
        byteCount = silence->getSize();
    }
    const int frames = static_cast<int>(byteCount / s.srcChannels / s.srcBytes);

    // Samples of the inner width are used in place.
    P<IMemoryBlock> widened;
    const void* pcm = bytes;
    if (s.srcBytes != s.sampleBytes || reinterpret_cast<uintptr_t>(bytes) % s.sampleBytes != 0) {
        widened = s.widen(bytes, frames);
        pcm = widened->getData();
    }

    s.split(pcm, frames);
    for (int i = 0; i < s.dstChannels; ++i) s.resample(s.channels[i]);
    const int count = s.channels[0].produced; // the channels stay in step
    const P<IMemoryBlock> block = s.assemble(count);
    for (int i = 0; i < s.dstChannels; ++i) s.channels[i].output = nullptr;

    const double offset = s.useStartTime ? s.startTime : 0.0;
    const double timestamp = static_cast<double>(s.outputPosition) / s.dstRate + offset;
    s.outputPosition += static_cast<uint32_t>(count);
    return peru::make<audio::CAudioChunk>(timestamp, block);
}

} // namespace sonora2::samplerateconverter
