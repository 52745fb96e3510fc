#include "support_av/CodecLibrary.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"

#include <dlfcn.h>
#include <string>

namespace sonora2::plugins::av {

namespace {

// Beside the module that this code is linked into. By its path, since interceptors of dlopen search the run
// path of their own module.
std::string findCodecLibrary() {
    Dl_info module = {};
    if (!::dladdr(reinterpret_cast<void*>(&findCodecLibrary), &module)) return CODECS_SONAME;
    const std::string path = module.dli_fname;
    return path.substr(0, path.rfind('/') + 1) + CODECS_SONAME;
}

} // namespace

CreateFunction loadCodecLibrary() {
    // A second call only adds a reference.
    void* const library = ::dlopen(findCodecLibrary().c_str(), RTLD_NOW | RTLD_LOCAL);
    void* const entry = library ? ::dlsym(library, kCreateName) : nullptr;
    if (!entry) throw common::CSonoraError(peru::format("could not load " CODECS_SONAME ": %s", ::dlerror()));
    return reinterpret_cast<CreateFunction>(entry);
}

} // namespace sonora2::plugins::av
