#include "tonewright/EncoderHandle.h"

#include "sonora2/media/IDiscardable.h"

namespace tonewright {

using sonora2::common::CAudioEncoder;
using sonora2::common::IDiscardable;

CEncoderHandle::CEncoderHandle(const P<sonora2::common::ISonoraContext>& context,
                               const P<sonora2::common::IAudioSource>& source,
                               const P<sonora2::common::IAudioFormat>& format)
    : m_format(format), m_encoder(peru::make<CAudioEncoder>(context, source, format)) {
    m_encoder->addListener(this);
}

CEncoderHandle::~CEncoderHandle() {
    m_encoder->removeListener(this);
}

void CEncoderHandle::run() {
    m_isDiscarding = false;
    try {
        m_encoder->encode();
    } catch (...) {
        discard();
        throw;
    }
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
    bool goesOn = !callback || callback(fraction, reserved);
    if (const auto function = m_progress.get(); function && !(*function)(fraction)) goesOn = false;
    if (!m_isDiscarding) return goesOn;
    // Before the encoder closes the format, which would complete the file.
    discard();
    return false;
}

} // namespace tonewright
