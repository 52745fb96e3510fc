#include "peru/media/posix/SoundLibraries.h"

#include "peru/media/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <dlfcn.h>
#include <memory>

namespace peru::media::posix {

namespace {

struct SLibraryCloser {
    void operator()(void* library) const { ::dlclose(library); }
};
using Library = std::unique_ptr<void, SLibraryCloser>;

// Only libraries that the engine has loaded are of interest; this loads nothing.
Library getLoaded(const char* name) {
    return Library(::dlopen(name, RTLD_NOW | RTLD_NOLOAD));
}

template <class F> F getSymbol(const Library& library, const char* name) {
    return library ? reinterpret_cast<F>(::dlsym(library.get(), name)) : nullptr;
}

constexpr const char* kAlsa = "libasound.so.2";
constexpr const char* kJack = "libjack.so.0";

extern "C" {
using AlsaErrorHandler = void (*)(const char*, int, const char*, int, const char*, ...);
using JackMessageHandler = void (*)(const char*);

static void ignoreAlsaError(const char*, int, const char*, int, const char*, ...) {}
static void ignoreJackMessage(const char*) {}
}

} // namespace

void silenceSoundLibraries() {
    const Library alsa = getLoaded(kAlsa);
    if (auto set = getSymbol<int (*)(AlsaErrorHandler)>(alsa, "snd_lib_error_set_handler"))
        set(ignoreAlsaError);
    const Library jack = getLoaded(kJack);
    for (const char* name : {"jack_set_error_function", "jack_set_info_function"})
        if (auto set = getSymbol<void (*)(JackMessageHandler)>(jack, name)) set(ignoreJackMessage);
}

bool hasConfiguredDevices() {
    const Library alsa = getLoaded(kAlsa);
    auto update = getSymbol<int (*)()>(alsa, "snd_config_update");
    auto describe = getSymbol<const char* (*)(int)>(alsa, "snd_strerror");
    auto configuration = getSymbol<void**>(alsa, "snd_config");
    auto search = getSymbol<int (*)(void*, const char*, void**)>(alsa, "snd_config_search");
    if (!update || !describe || !configuration || !search) return true;
    if (const int error = update(); error < 0)
        throw CMediaException(localize("peru.media.CSystem.BadConfiguration",
                                       "The configuration of the sound system cannot be read (%MSG%).",
                                       {{"%MSG%", describe(error)}}));
    void* device = nullptr;
    return *configuration && (search(*configuration, "pcm.default", &device) >= 0 ||
                              search(*configuration, "pcm.dmix", &device) >= 0);
}

} // namespace peru::media::posix
