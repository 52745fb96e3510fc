#include "sonora2_decmpa/MpegDecoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins {

class CDecmpaPlugin : public CPluginBase {
public:
    explicit CDecmpaPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_decmpa", {"mp3", "mp2", "mp1", "mpa", "mpga"}, {}) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CMpegDecoder>(file);
    }
};

} // namespace sonora2::plugins

SONORA2_PLUGIN(sonora2::plugins::CDecmpaPlugin);
