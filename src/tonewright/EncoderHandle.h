// What a host holds when it holds an encoder: the encoder and the host's callback.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "peru/Object.h"
#include "sonora2/encoding/AudioEncoder.h"
#include "sonora2/encoding/IEncodeListener.h"
#include "tonewright/tonewright.h"

#include <atomic>

namespace tonewright {

using peru::P;

// Listens to its encoder for as long as it lives, so that the callback may change at any time and from any
// thread. An interface cast finds the encoder behind it. Who runs the encoder keeps this object alive.
class CEncoderHandle : public peru::CObject,
                       public peru::IInterfaceQuery,
                       public sonora2::common::IEncodeListener {
public:
    explicit CEncoderHandle(const P<sonora2::common::CAudioEncoder>& encoder);
    ~CEncoderHandle() override;

    void setCallback(TONEWRIGHT_EncoderCallback callback) { m_callback = callback; }

    peru::SInterfaceQueryResult queryInterface(const std::type_info& wanted) override;
    bool onProgress(double fraction, int32_t reserved) override;

private:
    P<sonora2::common::CAudioEncoder> m_encoder;
    std::atomic<TONEWRIGHT_EncoderCallback> m_callback{nullptr};
};

} // namespace tonewright
