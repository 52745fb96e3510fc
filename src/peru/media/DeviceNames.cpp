#include "peru/media/DeviceNames.h"

#include "peru/strings/StringFormat.h"

#include <portaudio.h>

namespace peru::media {

P<IString> getHostApiName(int32_t type) {
    switch (type) {
    case paMME:
        return newString("MMSystem");
    case paDirectSound:
        return newString("DirectShow"); // the name shown to users
    case paWASAPI:
        return newString("WASAPI");
    default:
        return newString("UNKNOWN");
    }
}

P<IString> getHostApiDisplayName(int32_t type, const char* engineName) {
    constexpr int32_t kPulseAudio = 16; // newer than the engine's header
    switch (type) {
    case paALSA:
        return newString("ALSA");
    case paJACK:
        return newString("JACK");
    case paOSS:
        return newString("OSS");
    case kPulseAudio:
        return newString("PulseAudio");
    default:
        return CString::fromUTF8(engineName ? engineName : "");
    }
}

P<IString> getDeviceListName(int32_t index, const CStringArg& name, const CStringArg& hostApi,
                             bool isDefault) {
    return format(isDefault ? "ID: %d - %s (%s) [DEFAULT]" : "ID: %d - %s (%s)", index, name, hostApi);
}

} // namespace peru::media
