// Names under which devices are listed.
#pragma once

#include "peru/media/Api.h"
#include "peru/strings/String.h"

namespace peru::media {

// The name for the engine's type number of a host API.
PERU_MEDIA_API P<IString> getHostApiName(int32_t type);

// The name of the sound system as its users know it, such as "ALSA" or "JACK"; the engine's own where this
// library has none.
PERU_MEDIA_API P<IString> getHostApiDisplayName(int32_t type, const char* engineName);

// "ID: 3 - NAME (HOST API)", with " [DEFAULT]" for the default.
PERU_MEDIA_API P<IString> getDeviceListName(int32_t index, const CStringArg& name, const CStringArg& hostApi,
                                            bool isDefault);

} // namespace peru::media
