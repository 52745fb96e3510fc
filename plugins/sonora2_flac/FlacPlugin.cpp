// FLAC in its own container.
#include "sonora2_flac/FlacDecoder.h"
#include "sonora2_flac/FlacEncoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins::flac {

class CFlacPlugin : public CPluginBase {
public:
    explicit CFlacPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_flac", {"flac"}, {"flac"}) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CFlacDecoder>(file);
    }
    CEncoderFormat::EncoderFactory getEncoderFactory() override {
        return
            [](const SMediaFile&) -> std::unique_ptr<IEncoder> { return std::make_unique<CFlacEncoder>(); };
    }
};

} // namespace sonora2::plugins::flac

SONORA2_PLUGIN(sonora2::plugins::flac::CFlacPlugin);
