// Creates this platform's locks.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

namespace peru::posix {

// Creates a mutex without going through the global object factory, which needs one itself.
PERU_API P<IMutex> createPlainMutex();

class CMutexFactory : public CObject, public IMutexFactory {
public:
    P<IMutex> createMutex() override;
    P<IMutex> createGlobalMutex(const P<IString>& name) override;
};

} // namespace peru::posix
