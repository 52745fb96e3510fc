// The plug-in handlers of the running library, for libraries that stand beside the front.
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

// The front sets it when it starts and clears it before the plug-ins are unloaded. A reader must not keep a
// handler across the end of the library. Any thread.
SONORA2_API void setMediaEnvironment(const SMediaEnvironment& environment);
SONORA2_API SMediaEnvironment getMediaEnvironment();

} // namespace sonora2::common
