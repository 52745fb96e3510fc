#include "sonora2_l3codec/Mp3Encoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins {

class CL3CodecPlugin : public CPluginBase {
public:
    explicit CL3CodecPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_l3codec", {}, {"mp3"}) {}

protected:
    CEncoderFormat::EncoderFactory getEncoderFactory() override {
        return [](const SMediaFile&) -> std::unique_ptr<IEncoder> { return std::make_unique<CMp3Encoder>(); };
    }
};

} // namespace sonora2::plugins

SONORA2_PLUGIN(sonora2::plugins::CL3CodecPlugin);
