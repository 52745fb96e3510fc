// The choice among candidates.
#pragma once

#include "freedb/Api.h"
#include "freedb/FreeDBDiscDesc.h"

#include <optional>
#include <vector>

namespace freedb {

class FREEDB_API IFreeDBHandler : public virtual peru::IBase {
public:
    // Called on the thread that drives the look-up. Returns the index of the disc, or nothing to end the
    // look-up. With `isExact` false no candidate is exactly the disc.
    virtual std::optional<size_t> chooseDisc(const std::vector<P<CFreeDBDiscDesc>>& candidates,
                                             bool isExact) = 0;
};

} // namespace freedb
