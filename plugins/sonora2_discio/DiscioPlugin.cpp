// Tracks of audio discs, in drives and in disc images.
#include "sonora2_discio/TrackDecoder.h"
#include "support/PluginBase.h"

namespace sonora2::plugins::discio {

class CDiscioPlugin : public CPluginBase {
public:
    explicit CDiscioPlugin(const P<common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_discio", {"cda"}, {}) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CTrackDecoder>(file);
    }
    // Which schemes are known is decided when the track is opened.
    bool serves(const SMediaFile&) override { return true; }
};

} // namespace sonora2::plugins::discio

SONORA2_PLUGIN(sonora2::plugins::discio::CDiscioPlugin);
