#include "codecs/AvDecoder.h"
#include "codecs/AvVideoSource.h"
#include "codecs/WmaEncoder.h"
#include "support/PluginBase.h"
#include "support_av/CodecLibrary.h"

namespace sonora2::plugins::av {

namespace {

// The extensions are listed by the plug-in in front of it.
class CAvPlugin : public CPluginBase {
public:
    CAvPlugin(const P<common::ISonoraContext>& context, const char* name)
        : CPluginBase(context, name, {}, {}) {}

    // A request for either kind gets sound if the file has any.
    P<common::ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SSourceParams* pParams) override {
        if (!uri) return nullptr;
        const SMediaFile file(uri);
        if (!serves(file)) return nullptr;
        const bool wantsVideo = nTypes & common::kVideoSource;
        if ((nTypes & common::kAudioSource) && (!wantsVideo || hasSound(file)))
            return CPluginBase::tryCreateSource(uri, nTypes, bDontCloseAfterTesting, pParams);
        if (!wantsVideo) return nullptr;
        return peru::make<CAvVideoSource>(getContext(), getPluginName(), file);
    }

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CAvDecoder>(file);
    }
    CEncoderFormat::EncoderFactory getEncoderFactory() override {
        return [](const SMediaFile&) -> std::unique_ptr<IEncoder> { return std::make_unique<CWmaEncoder>(); };
    }

private:
    static bool hasSound(const SMediaFile& file) {
        try {
            CDemuxer demuxer(file, AVMEDIA_TYPE_AUDIO);
            return true;
        } catch (const peru::CException&) {
            return false;
        }
    }
};

} // namespace

} // namespace sonora2::plugins::av

// The function that CodecLibrary.h describes.
extern "C" __attribute__((visibility("default"))) void
sonora2_avCreate(const peru::P<sonora2::common::ISonoraContext>& context, const char* name,
                 peru::P<sonora2::common::ISonoraPlugin>& plugin) {
    plugin = peru::make<sonora2::plugins::av::CAvPlugin>(context, name);
}
