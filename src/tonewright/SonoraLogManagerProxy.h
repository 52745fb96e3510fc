// Forwards the media framework's log to the program's log.
#pragma once

#include "peru/Object.h"
#include "sonora2/context/ILogManager.h"

namespace tonewright {

using peru::P;

// Stateless; safe from any thread.
class CSonoraLogManagerProxy : public peru::CObject, public sonora2::common::ILogManager {
public:
    ~CSonoraLogManagerProxy() override;

    // In the framework 0 is the most severe level, in the program's log the highest number is. Unknown
    // levels map to info.
    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override; // at error level
};

} // namespace tonewright
