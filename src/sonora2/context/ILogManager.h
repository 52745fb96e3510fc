// The framework's own log.
#pragma once

#include "peru/strings/String.h"
#include "sonora2/Api.h"

namespace peru {
class CException;
}

namespace sonora2::common {

using peru::P;

// Lower is more severe, the reverse of peru::ELogLevel.
enum ESeverity : int32_t {
    kSeverityError = 0,
    kSeverityWarning = 1,
    kSeverityInfo = 2,
    kSeverityDebug = 3,
    kSeverityTrace = 4,
};

// Safe from any thread.
class SONORA2_API ILogManager : public virtual peru::IBase {
public:
    virtual void log(int32_t severity, const P<peru::IString>& text) = 0;
    virtual void logException(const peru::CException& exception) = 0;
};

} // namespace sonora2::common
