#include "sonora2/samplerateconverter/SampleRateConverter.h"

#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/samplerateconverter/ChannelConverters.h"
#include "sonora2/samplerateconverter/Resampler.h"
#include "sonora2/samplerateconverter/SampleWidths.h"

#include <cstring>
#include <new>
#include <utility>

namespace sonora2::samplerateconverter {

using peru::IMemoryBlock;

namespace {

constexpr int kMaxChannels = CSampleRateConverter::CChannelConverter::kMaxChannels;
constexpr int kSampleBytes = sizeof(int16_t);
constexpr int kOutputBlockBytes = CSampleRateConverter::kMaxOutputFrames * kSampleBytes;
constexpr int kMaxRate = 1 << 24; // far above any real rate; bounds the memory of a flush

constexpr int kFilterSize = 16;
constexpr int kPhaseShift = 10;
constexpr int kLinear = 0;
constexpr double kCutoff = 1.0;

struct SResamplerDeleter {
    void operator()(SResampler* resampler) const { resamplerClose(resampler); }
};

int16_t* shorts(const P<IMemoryBlock>& block) {
    return reinterpret_cast<int16_t*>(block->getData());
}

} // namespace

struct CSampleRateConverter::SImpl {
    struct SChannel {
        P<IMemoryBlock> input; // for the filter, carry-over first
        int carryBytes = 0;    // bytes of the input consumed by the last call
        int carrySamples = 0;  // samples left for the next call
        std::unique_ptr<SResampler, SResamplerDeleter> resampler;
        P<IMemoryBlock> output; // during one call
        int produced = 0;
    };

    P<peru::IMemoryManager> memoryManager;
    double startTime = -1.0;
    bool useStartTime = false;
    int srcRate, srcChannels, srcBytes;
    int dstRate, dstChannels, dstBytes;
    bool planarOutput;
    uint32_t outputPosition = 0;
    P<CChannelConverter> matrix; // set by the first conversion
    std::array<SChannel, kMaxChannels> channels;

    void prepare();
    P<IMemoryBlock> makeSilence();
    void split(const int16_t* pcm, int frames);
    void resample(SChannel& channel);
    P<IMemoryBlock> assemble(int frames);
};

// Rejects unsupported formats at the first conversion, not earlier: a converter may never be used.
void CSampleRateConverter::SImpl::prepare() {
    if (srcBytes < 1 || srcBytes > 4)
        throw peru::CError(peru::format(
            "CSampleRateConverter: could not convert samples to short SrcBytesPerSample %d", srcBytes));
    P<CChannelConverter> found = CChannelConverter::create(srcChannels, dstChannels);
    if (!found)
        throw peru::CError(
            peru::format("CSampleRateConverter: no suitable ChannelConversion found for %d -> %d",
                         srcChannels, dstChannels));
    if (dstBytes != 1 && dstBytes != 2)
        throw peru::CError(peru::format(
            "CSampleRateConverter: could not convert samples from short DstBytesPerSample %d", dstBytes));
    for (int i = 0; i < dstChannels; ++i) {
        SChannel& channel = channels[i];
        if (srcRate <= kMaxRate && dstRate <= kMaxRate)
            channel.resampler.reset(
                resamplerInit(dstRate, srcRate, kFilterSize, kPhaseShift, kLinear, kCutoff));
        if (!channel.resampler)
            throw peru::CError(
                peru::format("CSampleRateConverter: no filter could be made for %d -> %d frames per second",
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

void CSampleRateConverter::SImpl::split(const int16_t* pcm, int frames) {
    CChannelConverter::SourcePointers source{};
    for (int i = 0; i < srcChannels; ++i) source[i] = pcm + i;
    CChannelConverter::PlanePointers planes{};
    for (int i = 0; i < dstChannels; ++i) {
        SChannel& channel = channels[i];
        const int64_t carry = channel.input->getSize() - channel.carryBytes;
        const int64_t added = int64_t{frames} * kSampleBytes;
        P<IMemoryBlock> block = memoryManager->getBlock(carry + added);
        if (carry > 0)
            std::memcpy(block->getData(), channel.input->getData() + channel.carryBytes,
                        static_cast<size_t>(carry));
        planes[i] = reinterpret_cast<int16_t*>(block->getData() + carry);
        if (!matrix->isPlaneWritten(i) && added > 0) std::memset(planes[i], 0, static_cast<size_t>(added));
        channel.input = std::move(block);
        channel.carryBytes = 0;
    }
    matrix->convert(frames, source, srcChannels * kSampleBytes, planes);
}

void CSampleRateConverter::SImpl::resample(SChannel& channel) {
    const int samples = static_cast<int>(channel.input->getSize() / kSampleBytes);
    channel.output = memoryManager->getBlock(kOutputBlockBytes);
    int consumed = 0;
    channel.produced = resamplerRun(channel.resampler.get(), shorts(channel.output), shorts(channel.input),
                                    &consumed, samples, kMaxOutputFrames);
    if (channel.produced < 0) throw std::bad_alloc();
    channel.carrySamples = samples - consumed;
    channel.carryBytes = consumed * kSampleBytes;
    // Usually nothing is left over: return the block to the pool before the next chunk needs one.
    if (channel.carrySamples == 0) {
        channel.input = memoryManager->getBlock(0);
        channel.carryBytes = 0;
    }
}

P<IMemoryBlock> CSampleRateConverter::SImpl::assemble(int frames) {
    const P<IMemoryBlock> block = memoryManager->getBlock(int64_t{dstBytes} * dstChannels * frames);
    // 16-bit samples are written in place; 8-bit samples are narrowed from the same order of samples.
    P<IMemoryBlock> ordered = block;
    if (dstBytes == 1) ordered = memoryManager->getBlock(int64_t{kSampleBytes} * dstChannels * frames);
    if (planarOutput) {
        for (int i = 0; i < dstChannels; ++i)
            std::memcpy(shorts(ordered) + int64_t{i} * frames, channels[i].output->getData(),
                        static_cast<size_t>(frames) * kSampleBytes);
    } else {
        std::array<const int16_t*, kMaxChannels> planes{};
        for (int i = 0; i < dstChannels; ++i) planes[i] = shorts(channels[i].output);
        interleave(planes, dstChannels, frames, shorts(ordered));
    }
    if (dstBytes == 1) narrowToByte(shorts(ordered), int64_t{dstChannels} * frames, block->getData());
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

    // 16-bit samples are used in place.
    P<IMemoryBlock> narrowed;
    const int16_t* pcm = reinterpret_cast<const int16_t*>(bytes);
    if (s.srcBytes != kSampleBytes || reinterpret_cast<uintptr_t>(bytes) % alignof(int16_t) != 0) {
        const int64_t samples = int64_t{frames} * s.srcChannels;
        narrowed = s.memoryManager->getBlock(samples * kSampleBytes);
        widenToShort(bytes, s.srcBytes, samples, shorts(narrowed));
        pcm = shorts(narrowed);
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
