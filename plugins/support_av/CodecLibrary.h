// The library with the code of the plug-ins over libav.
#pragma once

#include "sonora2/plugins/ISonoraPlugin.h"

namespace sonora2::plugins::av {

using peru::P;

// libav and what it depends on are a hundred libraries, which take longer to load than a small file takes to
// convert. The plug-ins therefore only list their extensions, and load this library when they are asked for a
// source or a format for the first time. It is never unloaded.
using CreateFunction = void (*)(const P<common::ISonoraContext>& context, const char* name,
                                P<common::ISonoraPlugin>& plugin);
inline constexpr const char* kCreateName = "sonora2_avCreate";

// From the folder of the calling plug-in; throws CSonoraError with the loader's reason. Any thread.
CreateFunction loadCodecLibrary();

} // namespace sonora2::plugins::av
