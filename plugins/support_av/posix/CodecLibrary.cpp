#include "support_av/CodecLibrary.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"

#include <dlfcn.h>

namespace sonora2::plugins::av {

CreateFunction loadCodecLibrary() {
    // The loader searches the run path of the module that this code is linked into. A second call only adds a
    // reference.
    void* const library = ::dlopen(CODECS_SONAME, RTLD_NOW | RTLD_LOCAL);
    void* const entry = library ? ::dlsym(library, kCreateName) : nullptr;
    if (!entry) throw common::CSonoraError(peru::format("could not load " CODECS_SONAME ": %s", ::dlerror()));
    return reinterpret_cast<CreateFunction>(entry);
}

} // namespace sonora2::plugins::av
