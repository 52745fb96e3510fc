#include "support/PluginBase.h"

#include "sonora2/plugins/ParameterRecord.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "support/DecoderSource.h"

#include <utility>

namespace sonora2::plugins {

CPluginBase::CPluginBase(const P<common::ISonoraContext>& context, const char* name,
                         Extensions readExtensions, Extensions writeExtensions)
    : m_context(context), m_name(peru::newString(name)), m_readExtensions(std::move(readExtensions)),
      m_writeExtensions(std::move(writeExtensions)) {}

CPluginBase::~CPluginBase() = default;

int CPluginBase::getValidTypes() {
    return (m_readExtensions.empty() ? 0 : common::kAudioSource) |
           (m_writeExtensions.empty() ? 0 : common::kAudioFormat);
}

P<common::IPluginExtensions> CPluginBase::getValidExtensions(int nTypes) {
    auto extensions = peru::make<common::CPluginExtensions>();
    const auto add = [&](const Extensions& list) {
        for (const std::string& extension : list)
            extensions->addExtension(peru::CString::fromUTF8(extension));
    };
    if (nTypes & common::kAudioSource) add(m_readExtensions);
    if (nTypes & common::kAudioFormat) add(m_writeExtensions);
    return extensions;
}

P<common::ISource> CPluginBase::tryCreateSource(const P<peru::IURI>& uri, int nTypes,
                                                bool bDontCloseAfterTesting, const SSourceParams* pParams) {
    if (!(nTypes & common::kAudioSource) || !uri) return nullptr;
    const SMediaFile file(uri);
    if (!serves(file)) return nullptr;
    std::unique_ptr<IDecoder> decoder = createDecoder(file);
    if (!decoder) return nullptr;
    const SSourceParams params = common::receiveRecord(pParams);
    const SPcmFormat wanted{params.nSampleRate, params.nChannelCount, params.nBytesPerSample};
    auto source = peru::make<CDecoderSource>(m_context, m_name, file, std::move(decoder), wanted);
    if (!pParams) return source;
    source->open();
    if (!bDontCloseAfterTesting) source->close();
    return source;
}

P<common::IFormat> CPluginBase::tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool,
                                                const SFormatParams* pParams) {
    const CEncoderFormat::EncoderFactory factory = getEncoderFactory();
    if (!(nTypes & common::kAudioFormat) || !uri || !factory) return nullptr;
    const SMediaFile file(uri);
    if (!serves(file)) return nullptr;
    const SFormatParams params = common::receiveRecord(pParams);
    const SPcmFormat format{params.nSampleRate, params.nChannelCount, params.nBytesPerSample};
    bool accepted =
        format.rate > 0 && format.channels > 0 && format.bytesPerSample >= 1 && format.bytesPerSample <= 4;
    P<peru::IString> reason =
        peru::format({"sonora2.CPluginBase.format", "%d channels at %d Hz in %d bits are not supported"},
                     format.channels, format.rate, format.bytesPerSample * 8);
    try {
        accepted = accepted && factory(file)->accepts(format);
    } catch (const common::CSonoraError& error) {
        accepted = false;
        reason = error.getDescription();
    }
    if (!accepted) fail({"sonora2.plugins.write", "could not write %s: %s"}, file.getDisplayName(), reason);
    return peru::make<CEncoderFormat>(m_name, file, factory, format);
}

P<peru::IBase> CPluginBase::tryCreateObject(const P<peru::IURI>&, const SObjectParams*) {
    return nullptr;
}

std::unique_ptr<IDecoder> CPluginBase::createDecoder(const SMediaFile&) {
    return nullptr;
}

CEncoderFormat::EncoderFactory CPluginBase::getEncoderFactory() {
    return nullptr;
}

bool CPluginBase::serves(const SMediaFile& file) {
    return !file.path.empty();
}

} // namespace sonora2::plugins
