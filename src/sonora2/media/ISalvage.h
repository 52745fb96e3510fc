// Reading damaged files.
#pragma once

#include "peru/strings/String.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// A parameter of the context: "1" turns salvage on for the sources that are created afterwards.
constexpr uint32_t kSalvageParameterKey = 1;
constexpr const char* kSalvageParameter = "salvage";

// A source may have it; an interface cast finds it.
class SONORA2_API ISalvage : public virtual peru::IBase {
public:
    // Whether damaged parts are replaced by silence of the same length, with a warning in the log that states
    // the time range. Otherwise reading fails at the first one. An open source that is switched restarts at
    // its start time.
    virtual void setSalvage(bool salvage) = 0;
    virtual bool getSalvage() = 0;
};

} // namespace sonora2::common
