#include "support/PluginBase.h"
#include "support_av/LazyPlugin.h"

namespace sonora2::plugins::av {

// Windows Media: ASF, WMA and WMV.
class CWmfPlugin : public CLazyPlugin {
public:
    explicit CWmfPlugin(const P<common::ISonoraContext>& context)
        : CLazyPlugin(context, "sonora2_wmf", true) {}
};

} // namespace sonora2::plugins::av

SONORA2_PLUGIN(sonora2::plugins::av::CWmfPlugin);
