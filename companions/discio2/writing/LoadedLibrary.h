// Libraries that are loaded with their first use: most discs are read without them.
#pragma once

#include "Error.h"

#include <dlfcn.h>

namespace discio {

class CLoadedLibrary {
public:
    // Throws CDiscError. Stays loaded until the process ends.
    explicit CLoadedLibrary(const char* name) : m_handle(::dlopen(name, RTLD_NOW | RTLD_LOCAL)) {
        if (!m_handle) fail();
    }

    template <class Function> void find(const char* name, Function*& function) const {
        function = reinterpret_cast<Function*>(::dlsym(m_handle, name));
        if (!function) fail();
    }

private:
    [[noreturn]] static void fail() {
        const char* reason = ::dlerror();
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, reason ? reason : "a library is missing");
    }

    void* m_handle;
};

} // namespace discio
