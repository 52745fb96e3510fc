// Its entry point makes nothing.
#include "sonora2/common/ISonoraContext.h"
#include "sonora2/common/ISonoraPlugin.h"

extern "C" SONORA2_API void sonora2_pluginCreate(const peru::P<sonora2::common::ISonoraContext>&,
                                                 peru::P<sonora2::common::ISonoraPlugin>&) {}
