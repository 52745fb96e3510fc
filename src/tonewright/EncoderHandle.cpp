#include "tonewright/EncoderHandle.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IDiscardable.h"

#include <filesystem>

namespace tonewright {

using sonora2::common::CAudioEncoder;
using sonora2::common::CSonoraError;
using sonora2::common::IDiscardable;

namespace {

// Empty unless it is a local file.
std::string toPath(const P<peru::IURI>& uri) {
    return uri ? peru::CString::toStdString(peru::getPathes()->toPlatformPath(uri)) : std::string();
}

} // namespace

CEncoderHandle::CEncoderHandle(const P<sonora2::common::ISonoraContext>& context,
                               const P<sonora2::common::IAudioSource>& source,
                               const P<sonora2::common::IAudioFormat>& format)
    : m_source(source), m_format(format), m_encoder(peru::make<CAudioEncoder>(context, source, format)) {
    m_encoder->addListener(this);
}

CEncoderHandle::~CEncoderHandle() {
    m_encoder->removeListener(this);
}

void CEncoderHandle::run() {
    m_isDiscarding = false;
    m_reports = 0;
    try {
        requireOtherFile();
        requireSameFormat();
        m_encoder->encode();
    } catch (...) {
        if (!isWorthKeeping()) discard();
        throw;
    }
}

bool CEncoderHandle::isWorthKeeping() const {
    return m_reports > 1 && peru::interfaceCast<IRecordingTarget>(m_source);
}

// Links included: the job would read what it replaces.
void CEncoderHandle::requireOtherFile() const {
    const std::string from = toPath(m_source->getURI()), to = toPath(m_format->getURI());
    std::error_code none;
    if (!from.empty() && !to.empty() && std::filesystem::equivalent(from, to, none))
        throw CSonoraError(peru::format({"tonewright.CEncoderHandle.sameFile",
                                         "%s cannot be written: it is the source of the same export"},
                                        peru::CString::fromUTF8(to)));
}

// Nothing between the two converts: the samples would be written as what they are not.
void CEncoderHandle::requireSameFormat() const {
    const auto describe = [](auto& media) {
        return peru::format({"tonewright.CEncoderHandle.format", "%d Hz, %d channels, %d bytes per sample"},
                            media.getSampleRate(), media.getChannelCount(), media.getBytesPerSample());
    };
    const P<peru::IString> from = describe(*m_encoder), to = describe(*m_format);
    if (!from->equals(to))
        throw CSonoraError(peru::format(
            {"tonewright.CEncoderHandle.otherFormat", "the source delivers %s, but the format expects %s"},
            from, to));
}

void CEncoderHandle::discard() noexcept {
    if (const auto discardable = peru::interfaceCast<IDiscardable>(m_format)) discardable->discard();
}

void CEncoderHandle::setProgressFunction(std::function<bool(double)> function) {
    m_progress.set(std::move(function));
}

peru::SInterfaceQueryResult CEncoderHandle::queryInterface(const std::type_info& /*wanted*/) {
    return {nullptr, {m_encoder}};
}

bool CEncoderHandle::onProgress(double fraction, int32_t reserved) {
    const TONEWRIGHT_EncoderCallback callback = m_callback;
    ++m_reports;
    bool goesOn = !callback || callback(fraction, reserved);
    if (const auto function = m_progress.get(); function && !(*function)(fraction)) goesOn = false;
    if (!m_isDiscarding) return goesOn;
    // Before the encoder closes the format, which would complete the file.
    discard();
    return false;
}

} // namespace tonewright
