// Libraries that are loaded when first needed.
#pragma once

#include "peru/system/IDynamicLibrary.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Loads NAME.so from where plug-ins are searched, or else from the platform's search path. Throws CError with
// the loader's reason.
SONORA2_API P<peru::IDynamicLibrary> loadCompanionLibrary(const char* name);

// Throws CError, which names the function.
SONORA2_API void* requireSymbol(const P<peru::IDynamicLibrary>& library, const char* name);

// The same with a function's type, as in requireFunction<decltype(createEqualizer)>(library,
// "createEqualizer").
template <class Function>
Function* requireFunction(const P<peru::IDynamicLibrary>& library, const char* name) {
    return reinterpret_cast<Function*>(requireSymbol(library, name));
}

} // namespace sonora2::common
