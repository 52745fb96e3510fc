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

P<IString> getDeviceListName(int32_t index, const CStringArg& name, const CStringArg& hostApi,
                             bool isDefault) {
    return format(isDefault ? "ID: %d - %s (%s) [DEFAULT]" : "ID: %d - %s (%s)", index, name, hostApi);
}

} // namespace peru::media
