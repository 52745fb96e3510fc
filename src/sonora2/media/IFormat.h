// A format writes media to a URI.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Opening creates the file; closing completes it. Failures are thrown as peru::CException. One thread at a
// time.
class SONORA2_API IFormat : public virtual peru::IBase {
public:
    virtual bool isOpened() = 0;
    virtual void open() = 0;
    virtual void close() = 0;
    virtual P<peru::IURI> getURI() = 0;
    virtual P<peru::IString> getPluginName() = 0;
    virtual int64_t getEstimatedSizeBytes(double fDuration) = 0; // output file size for that many seconds
};

} // namespace sonora2::common
