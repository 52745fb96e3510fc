#include "support/PluginBase.h"
#include "support_av/LazyPlugin.h"

namespace sonora2::plugins::av {

// The same as sonora2_dsgraph, under the name that a plug-in handler without a list loads.
class CFfmpegPlugin : public CLazyPlugin {
public:
    explicit CFfmpegPlugin(const P<common::ISonoraContext>& context)
        : CLazyPlugin(context, "sonora2_ffmpeg", false) {}
};

} // namespace sonora2::plugins::av

SONORA2_PLUGIN(sonora2::plugins::av::CFfmpegPlugin);
