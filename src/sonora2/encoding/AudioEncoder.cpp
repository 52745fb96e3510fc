#include "sonora2/encoding/AudioEncoder.h"

#include "peru/IInterfaceQuery.h"
#include "peru/strings/LocalizedFormat.h"
#include "sonora2/context/LoggedCall.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/encoding/SampleReader.h"
#include "sonora2/media/CloseGuard.h"
#include "sonora2/media/IFloatSamples.h"

#include <limits>

namespace sonora2::common {

namespace {

// One block size for all formats: a multiple of what the usual codecs frame (1152, 576, 512).
constexpr int kBlockFrames = 4608;

// Errors are only logged.
template <class Media> void closeQuietly(const P<Media>& media, const P<ISonoraContext>& context) noexcept {
    callLogged(context->getLogManager(), [&] {
        if (media && media->isOpened()) media->close();
    });
}

} // namespace

CAudioEncoder::CAudioEncoder(const P<ISonoraContext>& context, const P<IAudioSource>& source,
                             const P<IAudioFormat>& format)
    : m_listeners(peru::make<peru::TFrailArray<IEncodeListener>>()), m_source(source), m_format(format),
      m_context(context) {
    const bool wasOpened = m_source->isOpened();
    const CCloseGuard guard(*m_source, !wasOpened);
    if (!wasOpened) m_source->open();
    m_sampleRate = m_source->getSampleRate();
    m_bytesPerSample = m_source->getBytesPerSample();
    m_channelCount = m_source->getChannelCount();
    if (!wasOpened) m_source->close();
}

CAudioEncoder::~CAudioEncoder() {
    closeQuietly(m_source, m_context);
    closeQuietly(m_format, m_context);
}

void CAudioEncoder::addListener(IEncodeListener* listener) {
    m_listeners->add(listener);
}

bool CAudioEncoder::removeListener(IEncodeListener* listener) {
    return m_listeners->remove(listener);
}

bool CAudioEncoder::hasListener(const IEncodeListener* listener) const {
    return m_listeners->contains(listener);
}

bool CAudioEncoder::notify(double total, double current) {
    const double fraction = total < std::numeric_limits<double>::epsilon() ? 0.0 : current / total;
    for (size_t i = 0; i < m_listeners->getCount(); ++i) {
        IEncodeListener* listener = m_listeners->at(i);
        if (listener && !listener->onProgress(fraction, 0)) return false;
    }
    return true;
}

void CAudioEncoder::close() {
    m_format->close();
    m_source->close();
}

// Both ends are at hand here, and nothing between them looks at the samples.
bool CAudioEncoder::agreeOnFloat() {
    const auto source = peru::interfaceCast<IFloatSamples>(m_source);
    const auto format = peru::interfaceCast<IFloatSamples>(m_format);
    if (!source || !format || m_format->isOpened()) return false;
    if (m_source->getSampleRate() != m_format->getSampleRate() ||
        m_source->getChannelCount() != m_format->getChannelCount())
        return false;
    for (const int bytes : {4, 8}) {
        if (!source->canUseFloat(bytes) || !format->canUseFloat(bytes)) continue;
        format->useFloat(bytes);
        source->useFloat(bytes);
        return true;
    }
    return false;
}

void CAudioEncoder::encode() {
    if (!m_source->isOpened()) m_source->open();
    // Closing returns the source to integers, which its next user expects.
    const CCloseGuard guard(*m_source, agreeOnFloat());
    if (!m_format->isOpened()) m_format->open();
    // Queried once: it may cost a round trip to another process.
    const double duration = m_source->getDuration();
    notify(duration, 0.0);

    const P<CSampleReader> reader = peru::make<CSampleReader>(m_context, m_source);
    if (!m_source->isOpened()) m_source->open();
    while (reader->hasSamples()) {
        const P<audio::IAudioChunk> chunk = reader->getSamples(kBlockFrames);
        if (!chunk) {
            if (reader->hasSamples())
                throw CSonoraError(
                    peru::localize("sonora2.CAudioEncoder.noChunk",
                                   "CAudioEncoder: AudioChunk=NULL but SampleReader hat samples!"));
            continue;
        }
        if (!notify(duration, chunk->getTimestamp())) return close();
        m_format->writeAudioChunk(chunk);
    }
    notify(duration, duration);
    close();
}

} // namespace sonora2::common
