// Names under which devices are listed.
#pragma once

#include "peru/media/Api.h"
#include "peru/strings/String.h"

namespace peru::media {

// The name for the engine's type number of a host API.
PERU_MEDIA_API P<IString> getHostApiName(int32_t type);

// "ID: 3 - NAME (HOST API)", with " [DEFAULT]" for the default.
PERU_MEDIA_API P<IString> getDeviceListName(int32_t index, const CStringArg& name, const CStringArg& hostApi,
                                            bool isDefault);

} // namespace peru::media
