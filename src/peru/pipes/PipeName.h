// Names of pipes.
#pragma once

#include "peru/strings/String.h"

namespace peru {

constexpr int32_t kLongestPipeName = 80; // bytes

// False for a name that could leave the folder or name space of the pipes; see IPipeManager.
PERU_API bool isPipeName(const CStringArg& name);
// The full name where the system has a name space for pipes: "\\.\pipe\" and the short name.
PERU_API P<IString> getFullPipeName(const CStringArg& name);

} // namespace peru
