// Makes the locks of this platform.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

namespace peru::posix {

// A mutex without a request to the global object factory, whose own mutex this is.
PERU_API P<IMutex> createPlainMutex();

class CMutexFactory : public CObject, public IMutexFactory {
public:
    P<IMutex> createMutex() override;
    P<IMutex> createGlobalMutex(const P<IString>& name) override;
};

} // namespace peru::posix
