// The module as the front library uses it, which loads it on first use.
#pragma once

#include "graphics/Api.h"
#include "peru/strings/String.h"

namespace ced {

using peru::P;

class GRAPHICS_API ILibrary : public virtual peru::IBase {
protected:
    ~ILibrary() override = default;

public:
    // Of the build. The module has a package of its own and C++ interfaces, so it fits the front library of
    // the same version only.
    virtual P<peru::IString> getVersion() = 0;
};

// The function that the module exports.
using GetLibraryFunction = void (*)(P<ILibrary>& library);
inline constexpr const char* kGetLibraryName = "tonewright_covereditor_getLibrary";

} // namespace ced
