// A format that can drop what it has written.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// Optional; found by an interface cast on a format.
class SONORA2_API IDiscardable : public virtual peru::IBase {
public:
    // Closes the format without a result: a file that existed before keeps its content, a new one is removed.
    // Does nothing on a closed format.
    virtual void discard() noexcept = 0;
};

} // namespace sonora2::common
