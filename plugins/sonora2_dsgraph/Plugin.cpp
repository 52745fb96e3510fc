#include "support/PluginBase.h"
#include "support_av/LazyPlugin.h"

namespace sonora2::plugins::av {

// Every format that libav reads and no other plug-in does.
class CDsgraphPlugin : public CLazyPlugin {
public:
    explicit CDsgraphPlugin(const P<common::ISonoraContext>& context)
        : CLazyPlugin(context, "sonora2_dsgraph", false) {}
};

} // namespace sonora2::plugins::av

SONORA2_PLUGIN(sonora2::plugins::av::CDsgraphPlugin);
