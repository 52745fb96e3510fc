// Bounds what a message of the other end may take.
#pragma once

#include "peru/streams/DataStreams.h"

namespace peru {

// Counts the bytes of each message. Reading more than the limit, or a string whose stated size is above the
// one for texts, throws CRemoteException before memory is allocated for it; the connection is then out of
// step.
class PERU_API CMessageInStream : public CDataInStream {
public:
    explicit CMessageInStream(const P<IInStream>& source);
    ~CMessageInStream() override;

    // In bytes. 0 means without limit, which is the default.
    void setLimits(int64_t message, int32_t text);
    // The message that follows may take the whole limit again.
    void startMessage();

    P<IString> readString() override;

private:
    class CCountedStream;

    explicit CMessageInStream(const P<CCountedStream>& counted);

    P<CCountedStream> m_counted;
    int32_t m_longestText = 0;
};

} // namespace peru
