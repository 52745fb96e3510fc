// The object behind an encoder handle: the encoder and the host's callback.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "peru/Object.h"
#include "sonora2/encoding/AudioEncoder.h"
#include "sonora2/encoding/IEncodeListener.h"
#include "tonewright/tonewright.h"

#include <atomic>

namespace tonewright {

using peru::P;

// Registered as a listener of its encoder for its whole lifetime, so that the callback may be changed at any
// time and from any thread. An interface cast finds the encoder. Whoever runs the encoder must keep this
// object alive.
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
