#include "tonewright/EncoderHandle.h"

namespace tonewright {

CEncoderHandle::CEncoderHandle(const P<sonora2::common::CAudioEncoder>& encoder) : m_encoder(encoder) {
    m_encoder->addListener(this);
}

CEncoderHandle::~CEncoderHandle() {
    m_encoder->removeListener(this);
}

peru::SInterfaceQueryResult CEncoderHandle::queryInterface(const std::type_info& /*wanted*/) {
    return {nullptr, {m_encoder}};
}

bool CEncoderHandle::onProgress(double fraction, int32_t reserved) {
    const TONEWRIGHT_EncoderCallback callback = m_callback;
    return !callback || callback(fraction, reserved);
}

} // namespace tonewright
