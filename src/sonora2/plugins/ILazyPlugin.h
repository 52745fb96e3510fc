// A plug-in that loads most of its code only when it is needed.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// Optional; found by an interface cast on a plug-in.
class SONORA2_API ILazyPlugin : public virtual peru::IBase {
public:
    // Loads everything that the plug-in will ever load, for a process that is about to lose access to files.
    // Throws CSonoraError. Without this call, the first source or format does it.
    virtual void load() = 0;
};

} // namespace sonora2::common
