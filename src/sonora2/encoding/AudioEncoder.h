// The encoding job: from one source into one format.
#pragma once

#include "peru/collections/FrailArray.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/encoding/IEncodeListener.h"
#include "sonora2/media/IAudioFormat.h"
#include "sonora2/media/IAudioSource.h"

namespace sonora2::common {

// One thread at a time. Exceptions of source and format propagate unchanged; both are then closed when the
// encoder is destroyed.
class SONORA2_API CAudioEncoder : public peru::CObject {
public:
    // Queries the source's sample format; a closed source is opened for that and closed again.
    CAudioEncoder(const P<ISonoraContext>& context, const P<IAudioSource>& source,
                  const P<IAudioFormat>& format);
    ~CAudioEncoder() override; // closes source and format if open; never throws

    // Listeners are not reference-counted: they must be removed before they are destroyed, which is allowed
    // during a call.
    void addListener(IEncodeListener* listener);
    bool removeListener(IEncodeListener* listener);
    bool hasListener(const IEncodeListener* listener) const;

    // Returns when everything is written or a listener has returned false; both are a normal end with source
    // and format closed. Listeners are called on this thread. Floating-point samples pass unchanged if both
    // source and format support them (IFloatSamples).
    void encode();

    int getSampleRate() const { return m_sampleRate; }
    int getBytesPerSample() const { return m_bytesPerSample; }
    int getChannelCount() const { return m_channelCount; }

private:
    bool notify(double total, double current);
    bool agreeOnFloat();
    void close();

    P<peru::TFrailArray<IEncodeListener>> m_listeners;
    P<IAudioSource> m_source;
    P<IAudioFormat> m_format;
    P<ISonoraContext> m_context;
    int m_sampleRate = 0;
    int m_bytesPerSample = 0;
    int m_channelCount = 0;
};

} // namespace sonora2::common
