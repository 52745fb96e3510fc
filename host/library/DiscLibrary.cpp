#include "library/DiscLibrary.h"

#include "InstallFolders.h"
#include "base/Text.h"
#include "base/Translation.h"

#include <dlfcn.h>
#include <filesystem>

namespace host {

namespace {

std::string findLibrary() {
    std::error_code none;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", none);
    const std::filesystem::path beside =
        program.parent_path().parent_path() / TONEWRIGHT_LIBDIR / DISCIO_SONAME;
    return std::filesystem::exists(beside, none) ? beside.string() : DISCIO_SONAME;
}

SDiscFunctions load() {
    void* const module = ::dlopen(findLibrary().c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!module)
        throw std::runtime_error(tr("host.DiscLibrary.missing", "The disc library cannot be loaded: %REASON%",
                                    {{"%REASON%", ::dlerror()}}));
    SDiscFunctions functions;
#define HOST_RESOLVE(name)                                                                                   \
    functions.name = reinterpret_cast<decltype(functions.name)>(::dlsym(module, "DISCIO_" #name));           \
    if (!functions.name)                                                                                     \
        throw std::runtime_error(tr("host.DiscLibrary.function", "The disc library has no function %NAME%",  \
                                    {{"%NAME%", "DISCIO_" #name}}));
    HOST_DISC_FUNCTIONS(HOST_RESOLVE)
#undef HOST_RESOLVE
    return functions;
}

} // namespace

const SDiscFunctions& getDiscFunctions() {
    static const SDiscFunctions s_functions = load();
    return s_functions;
}

std::runtime_error makeDiscError() {
    const SDiscFunctions& functions = getDiscFunctions();
    return std::runtime_error(toUTF8(functions.GetErrorMessageW(nullptr, functions.GetLastError(nullptr))));
}

} // namespace host
