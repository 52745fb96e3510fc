#include "sonora2/tracks/AudioChunkUnifier.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"

#include <algorithm>
#include <cstring>

namespace sonora2::audio {

namespace {

// An input that returns only empty chunks counts as ended after this many.
constexpr int kMaxEmptyChunks = 10000;

} // namespace

CAudioChunkUnifier::CAudioChunkUnifier(const P<common::ISonoraContext>& context, const P<IAudioTrack>& input)
    : m_track(input), m_context(context), m_format(getInputFormat()) {}

CAudioChunkUnifier::CAudioChunkUnifier(const P<common::ISonoraContext>& context,
                                       const P<common::IAudioSource>& input)
    : m_source(input), m_context(context), m_format(getInputFormat()) {}

CAudioChunkUnifier::~CAudioChunkUnifier() = default;

CAudioChunkUnifier::SFormat CAudioChunkUnifier::getInputFormat() const {
    const auto ask = [](auto& input) {
        return SFormat{input.getSampleRate(), input.getChannelCount(), input.getBytesPerSample()};
    };
    return m_track ? ask(*m_track) : ask(*m_source);
}

void CAudioChunkUnifier::setFormat(int sampleRate, int channelCount, int bytesPerSample) {
    m_format = {sampleRate, channelCount, bytesPerSample};
    m_converter.reset();
    const SFormat input = getInputFormat();
    if (input == m_format) return;
    m_converter = peru::make<samplerateconverter::CSampleRateConverter>(
        input.rate, input.channels, input.bytes, sampleRate, channelCount, bytesPerSample,
        m_context->getMemoryManager());
}

P<IAudioChunk> CAudioChunkUnifier::fetch() {
    const P<IAudioChunk> chunk = m_track ? m_track->getNextAudioChunk() : m_source->getNextAudioChunk();
    if (!m_converter || !chunk || chunk->getSize() == 0) return chunk;
    return m_converter->convert(chunk->getData(), static_cast<int>(chunk->getSize()));
}

bool CAudioChunkUnifier::advance() {
    for (int i = 0; i < kMaxEmptyChunks; ++i) {
        P<IAudioChunk> chunk = fetch();
        if (!chunk) return false;
        if (chunk->getSize() == 0) continue;
        m_chunk = std::move(chunk);
        m_offset = 0;
        return true;
    }
    return false;
}

P<IAudioChunk> CAudioChunkUnifier::getChunk(int frames) {
    const int64_t frameBytes = m_format.frameBytes();
    if (m_format.rate <= 0 || m_format.channels <= 0 || m_format.bytes <= 0)
        throw common::CSonoraError(peru::format(
            {"sonora2.CAudioChunkUnifier.format",
             "CAudioChunkUnifier: %d frames per second of %d channels of %d bytes are not a sound format"},
            m_format.rate, m_format.channels, m_format.bytes));
    if (frames < 0) throw peru::CInvalidArgError("frames", "CAudioChunkUnifier::getChunk");
    if (!m_chunk && !advance()) return nullptr;

    const double timestamp =
        m_chunk->getTimestamp() + static_cast<double>(m_offset / frameBytes) / m_format.rate;
    const int64_t bytes = frameBytes * frames;
    P<peru::IMemoryBlock> block = m_context->getMemoryManager()->getBlock(bytes);
    uint8_t* output = block->getData();
    int64_t done = 0;
    while (done < bytes && (m_chunk || advance())) {
        const int64_t count = std::min(bytes - done, m_chunk->getSize() - m_offset);
        std::memcpy(output + done, m_chunk->getData() + m_offset, static_cast<size_t>(count));
        done += count;
        m_offset += count;
        if (m_offset == m_chunk->getSize()) m_chunk.reset();
    }
    std::memset(output + done, 0, static_cast<size_t>(bytes - done));
    return peru::make<CAudioChunk>(timestamp, std::move(block));
}

} // namespace sonora2::audio
