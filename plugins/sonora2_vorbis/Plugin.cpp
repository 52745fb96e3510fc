#include "sonora2_vorbis/VorbisDecoder.h"
#include "sonora2_vorbis/VorbisEncoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins {

class CVorbisPlugin : public CPluginBase {
public:
    explicit CVorbisPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_vorbis", {"ogg", "oga"}, {"ogg", "oga"}) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CVorbisDecoder>(file);
    }
    CEncoderFormat::EncoderFactory getEncoderFactory() override {
        return
            [](const SMediaFile&) -> std::unique_ptr<IEncoder> { return std::make_unique<CVorbisEncoder>(); };
    }
};

} // namespace sonora2::plugins

SONORA2_PLUGIN(sonora2::plugins::CVorbisPlugin);
