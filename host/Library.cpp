#include "Library.h"

#include <cstdlib>
#include <dlfcn.h>
#include <stdexcept>
#include <string>

namespace host {

CLibrary::CLibrary() {
    // Messages reach the user through the log; the library need not print them as well.
    ::setenv("TONEWRIGHT_DEBUG_OUTPUT", "0", 0);
    const char* chosen = std::getenv("TONEWRIGHT_LIBRARY");
    m_module = ::dlopen(chosen ? chosen : TONEWRIGHT_SONAME, RTLD_NOW | RTLD_LOCAL);
    if (!m_module) throw std::runtime_error(std::string("cannot load the library: ") + ::dlerror());
#define HOST_RESOLVE(name)                                                                                   \
    name = reinterpret_cast<decltype(name)>(::dlsym(m_module, "TONEWRIGHT_" #name));                         \
    if (!name) throw std::runtime_error("the library has no function TONEWRIGHT_" #name);
    HOST_FUNCTIONS(HOST_RESOLVE)
#undef HOST_RESOLVE
}

void CLibrary::start() {
    if (InitStartup() != TONEWRIGHT_OK) throw std::runtime_error("the library could not be started");
}

// The module stays loaded: its singletons live until process end.
CLibrary::~CLibrary() {
    DeInitAll();
}

} // namespace host
