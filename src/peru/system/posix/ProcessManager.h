// Starts processes.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"

namespace peru::posix {

// The child gets the three standard files, default signal handling and the parent's environment. It keeps a
// lower than normal priority of the parent if the user may not raise it.
class CProcessManager : public CObject, public IProcessManager {
public:
    P<IProcess> start(const P<IURI>& executable, const std::vector<P<IString>>& arguments,
                      int niceValue) override;
    int64_t getCurrentProcessId() const override;
};

} // namespace peru::posix
