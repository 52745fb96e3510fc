// A source delivers media from a URI.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Life cycle: create; open; read and skip in any order; close. Reopening starts at the beginning.
// Time is in seconds. Failures are thrown as peru::CException. One thread at a time.
class SONORA2_API ISource : public virtual peru::IBase {
public:
    virtual bool isOpened() = 0;
    virtual void open() = 0;
    virtual void close() = 0;
    virtual void skipToTime(double fTimestamp) = 0; // the next delivery starts at or after that time
    virtual double getDuration() = 0;
    virtual int getBufferStatus() = 0;                // fill state of the read-ahead, 0 to 100
    virtual bool isEOF() = 0;                         // nothing left to deliver
    virtual void setStartTime(double fStartTime) = 0; // offset within the medium
    virtual double getStartTime() = 0;
    virtual P<peru::IURI> getURI() = 0;
    virtual P<peru::IString> getPluginName() = 0;
};

} // namespace sonora2::common
