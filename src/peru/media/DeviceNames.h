// How devices are listed.
#pragma once

#include "peru/media/Api.h"
#include "peru/strings/String.h"

namespace peru::media {

// The name shown for the engine's type number of a host API, the way into the sound system.
PERU_MEDIA_API P<IString> getHostApiName(int32_t type);

// "ID: 3 - NAME (HOST API)", with " [DEFAULT]" for the default.
PERU_MEDIA_API P<IString> getDeviceListName(int32_t index, const CStringArg& name, const CStringArg& hostApi,
                                            bool isDefault);

} // namespace peru::media
