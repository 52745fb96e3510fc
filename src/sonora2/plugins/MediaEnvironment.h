// The running library's plug-in handlers, for libraries beside the front.
#pragma once

#include "peru/threads/IMutex.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/IPluginHandler.h"

namespace sonora2::common {

// All empty while the library is not started.
struct SMediaEnvironment {
    P<ISonoraContext> readContext;
    P<IPluginHandler> readHandler;
    P<ISonoraContext> writeContext;
    P<IPluginHandler> writeHandler;
};

// The front sets it at start-up and clears it before the plug-ins are unloaded. Readers must not hold a
// handler beyond that. Any thread.
SONORA2_API void setMediaEnvironment(const SMediaEnvironment& environment);
SONORA2_API SMediaEnvironment getMediaEnvironment();

} // namespace sonora2::common
