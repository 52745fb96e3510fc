#include "peru/media/AudioFormat.h"

#include "peru/strings/StringFormat.h"

namespace peru::media {

CAudioFormat::~CAudioFormat() = default;

P<IString> CAudioFormat::getDescription() const {
    return format("Sample Rate: %d Channel: %d Bits: %d", m_sampleRate, m_channelCount, m_bitsPerSample);
}

} // namespace peru::media
