// Its entry point creates no plug-in.
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ISonoraPlugin.h"

extern "C" SONORA2_API void sonora2_pluginCreate(const peru::P<sonora2::common::ISonoraContext>&,
                                                 peru::P<sonora2::common::ISonoraPlugin>&) {}
