// WAV, RF64, W64, AIFF, AU and CAF.
#include "sonora2_wav/SndfileDecoder.h"
#include "sonora2_wav/SndfileEncoder.h"
#include "sonora2_wav/WavEncoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins::wav {

namespace {

// The first one applies to names without a known extension.
const Extensions kExtensions{"wav", "wave", "rf64", "w64", "aif", "aiff", "aifc", "au", "snd", "caf"};

std::unique_ptr<IEncoder> makeEncoder(const SMediaFile& file) {
    const std::string extension = file.getExtension(kExtensions);
    if (extension == "wav" || extension == "wave") return std::make_unique<CWavEncoder>();
    return std::make_unique<CSndfileEncoder>(extension);
}

} // namespace

class CWavPlugin : public CPluginBase {
public:
    explicit CWavPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_wav", kExtensions, kExtensions) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CSndfileDecoder>(file);
    }
    CEncoderFormat::EncoderFactory getEncoderFactory() override { return makeEncoder; }
};

} // namespace sonora2::plugins::wav

SONORA2_PLUGIN(sonora2::plugins::wav::CWavPlugin);
