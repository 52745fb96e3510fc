// The media framework's log, written into the program's.
#pragma once

#include "peru/Object.h"
#include "sonora2/context/ILogManager.h"

namespace tonewright {

using peru::P;

// No state of its own; safe from any thread.
class CSonoraLogManagerProxy : public peru::CObject, public sonora2::common::ILogManager {
public:
    ~CSonoraLogManagerProxy() override;

    // The framework counts down to its worst severity, the program up; anything unknown is information.
    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override; // at the worst severity
};

} // namespace tonewright
