#include "sonora2/encoding/SampleReader.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/CloseGuard.h"

#include <algorithm>
#include <limits>

namespace sonora2::common {

CSampleReader::CSampleReader(const P<ISonoraContext>& context, const P<IAudioSource>& source)
    : m_source(source), m_buffer(peru::make<peru::CBufferedIOStream>(context->getMemoryManager())),
      m_context(context) {
    const bool wasOpened = m_source->isOpened();
    const CCloseGuard guard(*m_source, !wasOpened);
    if (!wasOpened) m_source->open();
    const int bytes = m_source->getBytesPerSample();
    const int channels = m_source->getChannelCount();
    if (!wasOpened) m_source->close();
    if (bytes <= 0 || channels <= 0 || channels > std::numeric_limits<int>::max() / bytes)
        throw CSonoraError(peru::format(
            {"sonora2.CSampleReader.format",
             "CSampleReader: the source has no usable format (%d channels of %d bytes per sample)"},
            channels, bytes));
    m_frameBytes = bytes * channels;
}

CSampleReader::~CSampleReader() = default;

bool CSampleReader::hasSamples() {
    return m_source->isOpened() && (m_buffer->getAvailable() > 0 || !m_source->isEOF());
}

P<audio::IAudioChunk> CSampleReader::getSamples(int frames) {
    if (frames < 0) throw peru::CInvalidArgError("frames", "CSampleReader::getSamples");
    const int64_t wanted = static_cast<int64_t>(m_frameBytes) * frames;
    while (m_buffer->getAvailable() < wanted && !m_source->isEOF()) {
        const P<audio::IAudioChunk> chunk = m_source->getNextAudioChunk();
        if (!chunk) {
            if (!m_source->isEOF())
                throw CSonoraError(peru::localize("sonora2.CSampleReader.noChunk",
                                                  "CSampleReader: AudioChunk=NULL but Source is not EOF!"));
            continue;
        }
        if (chunk->getSize() > 0) m_buffer->append(chunk->getMemoryBlock());
    }
    const int64_t size = std::min(wanted, m_buffer->getAvailable());
    if (m_buffer->getAvailable() == 0) return nullptr;

    const double timestamp = static_cast<double>(m_position) / m_source->getSampleRate();
    const P<peru::IMemoryBlock> block = m_context->getMemoryManager()->getBlock(size);
    const int64_t read = m_buffer->readSome(block->getData(), size);
    block->setSize(read);
    m_position += read / m_frameBytes;
    return peru::make<audio::CAudioChunk>(timestamp, block);
}

void CSampleReader::reset() {
    if (m_source->isOpened()) m_source->close();
    m_buffer->clear();
    m_position = 0;
}

} // namespace sonora2::common
