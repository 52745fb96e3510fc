#include "peru/media/posix/Engine.h"

#include "peru/media/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <dlfcn.h>
#include <portaudio.h>

namespace peru::media::posix {

namespace {

void* openLibrary() {
    // Never closed: threads of the sound libraries may still run in it.
    if (void* library = ::dlopen("libportaudio.so.2", RTLD_NOW | RTLD_LOCAL)) return library;
    throw CMediaException(localize("peru.media.CSystem.NoEngine",
                                   "The sound engine cannot be loaded (%MSG%).", {{"%MSG%", ::dlerror()}}));
}

void* getLibrary() {
    static void* const library = openLibrary();
    return library;
}

template <class Function> Function* find(Function*, const char* name) {
    if (void* symbol = ::dlsym(getLibrary(), name)) return reinterpret_cast<Function*>(symbol);
    throw CMediaException(localize("peru.media.CSystem.NoEngine",
                                   "The sound engine cannot be loaded (%MSG%).", {{"%MSG%", name}}));
}

} // namespace

void loadEngine() {
    find(&Pa_Initialize, "Pa_Initialize");
}

} // namespace peru::media::posix

// The engine's functions, which find the real ones at their first call.
#define FORWARD(result, name, parameters, arguments)                                                         \
    result name parameters {                                                                                 \
        static const auto function = peru::media::posix::find(&name, #name);                                 \
        return function arguments;                                                                           \
    }

extern "C" {
FORWARD(PaError, Pa_Initialize, (), ())
FORWARD(PaError, Pa_Terminate, (), ())
FORWARD(const char*, Pa_GetErrorText, (PaError code), (code))
FORWARD(const PaHostApiInfo*, Pa_GetHostApiInfo, (PaHostApiIndex index), (index))
FORWARD(PaDeviceIndex, Pa_GetDeviceCount, (), ())
FORWARD(PaDeviceIndex, Pa_GetDefaultInputDevice, (), ())
FORWARD(PaDeviceIndex, Pa_GetDefaultOutputDevice, (), ())
FORWARD(const PaDeviceInfo*, Pa_GetDeviceInfo, (PaDeviceIndex index), (index))
FORWARD(PaError, Pa_IsFormatSupported,
        (const PaStreamParameters* in, const PaStreamParameters* out, double rate), (in, out, rate))
FORWARD(PaError, Pa_OpenStream,
        (PaStream * *stream, const PaStreamParameters* in, const PaStreamParameters* out, double rate,
         unsigned long frames, PaStreamFlags flags, PaStreamCallback* callback, void* data),
        (stream, in, out, rate, frames, flags, callback, data))
FORWARD(PaError, Pa_CloseStream, (PaStream * stream), (stream))
FORWARD(PaError, Pa_StartStream, (PaStream * stream), (stream))
FORWARD(PaError, Pa_StopStream, (PaStream * stream), (stream))
FORWARD(PaError, Pa_AbortStream, (PaStream * stream), (stream))
FORWARD(PaError, Pa_IsStreamStopped, (PaStream * stream), (stream))
FORWARD(PaError, Pa_IsStreamActive, (PaStream * stream), (stream))
FORWARD(const PaStreamInfo*, Pa_GetStreamInfo, (PaStream * stream), (stream))
FORWARD(PaTime, Pa_GetStreamTime, (PaStream * stream), (stream))
}
