// Mutexes of the platform.
#pragma once

#include "peru/IMutex.h"

namespace peru::posix {

// A re-entrant mutex of this process, made without asking for any global object. Throws std::bad_alloc.
PERU_API P<IMutex> createPlainMutex();

} // namespace peru::posix
