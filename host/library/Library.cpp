#include "library/Library.h"

#include "InstallFolders.h"
#include "base/Translation.h"

#include <cstdlib>
#include <dlfcn.h>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <system_error>

namespace host {

namespace {

// In the build tree and in an installed tree alike, the library is in the neighbouring folder. The full path
// is used because whatever is interposed between this program and the loader, such as a sanitizer, has its
// own search path.
std::string findLibrary() {
    if (const char* chosen = std::getenv("TONEWRIGHT_LIBRARY")) return chosen;
    std::error_code none;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", none);
    const std::filesystem::path beside =
        program.parent_path().parent_path() / TONEWRIGHT_LIBDIR / TONEWRIGHT_SONAME;
    return std::filesystem::exists(beside, none) ? beside.string() : TONEWRIGHT_SONAME;
}

} // namespace

CLibrary::CLibrary() {
    // Messages reach the user through the log, so the library does not print them as well.
    ::setenv("TONEWRIGHT_DEBUG_OUTPUT", "0", 0);
    m_module = ::dlopen(findLibrary().c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!m_module)
        throw std::runtime_error(
            tr("host.Library.load", "cannot load the library: %REASON%", {{"%REASON%", ::dlerror()}}));
#define HOST_RESOLVE(name)                                                                                   \
    name = reinterpret_cast<decltype(name)>(::dlsym(m_module, "TONEWRIGHT_" #name));                         \
    if (!name)                                                                                               \
        throw std::runtime_error(tr("host.Library.function", "the library has no function %NAME%",           \
                                    {{"%NAME%", "TONEWRIGHT_" #name}}));
    HOST_FUNCTIONS(HOST_RESOLVE)
#undef HOST_RESOLVE
}

void CLibrary::start() {
    if (InitStartup() != TONEWRIGHT_OK)
        throw std::runtime_error(tr("host.Library.start", "the library could not be started"));
}

// The module stays loaded: its singletons live until process end.
CLibrary::~CLibrary() {
    DeInitAll();
}

} // namespace host
