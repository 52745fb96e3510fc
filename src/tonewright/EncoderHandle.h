// The object behind an encoder handle: the encoder and the host's callbacks.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "peru/Object.h"
#include "sonora2/encoding/AudioEncoder.h"
#include "sonora2/encoding/IEncodeListener.h"
#include "tonewright/CallbackSlot.h"
#include "tonewright/ICallbackTargets.h"
#include "tonewright/tonewright.h"

#include <atomic>

namespace tonewright {

// Registered as a listener of its encoder for its whole lifetime, so that the callbacks may be changed at any
// time and from any thread. An interface cast finds the encoder. Whoever runs the job must keep this object
// alive.
class CEncoderHandle : public peru::CObject,
                       public peru::IInterfaceQuery,
                       public sonora2::common::IEncodeListener,
                       public IEncoderProgressTarget {
public:
    CEncoderHandle(const P<sonora2::common::ISonoraContext>& context,
                   const P<sonora2::common::IAudioSource>& source,
                   const P<sonora2::common::IAudioFormat>& format);
    ~CEncoderHandle() override;

    // Runs the whole job on this thread. If it throws, the format has dropped what was written, unless the
    // source is a recording: nobody can make the same sound again.
    void run();
    void setCallback(TONEWRIGHT_EncoderCallback callback) { m_callback = callback; }

    void setProgressFunction(std::function<bool(double)> function) override;
    void stopAndDiscard() override { m_isDiscarding = true; }

    peru::SInterfaceQueryResult queryInterface(const std::type_info& wanted) override;
    bool onProgress(double fraction, int32_t reserved) override;

private:
    void requireOtherFile() const;
    void requireSameFormat() const;
    void discard() noexcept;
    bool isWorthKeeping() const;

    P<sonora2::common::IAudioSource> m_source;
    P<sonora2::common::IAudioFormat> m_format;
    P<sonora2::common::CAudioEncoder> m_encoder;
    std::atomic<TONEWRIGHT_EncoderCallback> m_callback{nullptr};
    TCallbackSlot<bool(double)> m_progress;
    std::atomic<bool> m_isDiscarding{false};
    int64_t m_reports = 0; // of the running job: one before the first block, then one for each
};

} // namespace tonewright
