// Reads and writes the extension "tst" without files: every source has 1 second of the requested format.
// Sources whose file name begins with "refuse" throw from open.
#include "sonora2/context/SonoraError.h"
#include "support/FakeMedia.h"

using namespace tests;

extern "C" SONORA2_API void sonora2_pluginCreate(const P<sonora2::common::ISonoraContext>&,
                                                 P<sonora2::common::ISonoraPlugin>& plugin) {
    auto made = peru::make<CFakePlugin>("testplugin_good", std::initializer_list<const char*>{"tst"});
    made->makeSource = [](const P<peru::IURI>& uri, const CFakePlugin::SSourceParams& params) {
        SFakeSource script;
        script.rate = params.nSampleRate;
        script.channels = params.nChannelCount;
        script.bytesPerSample = params.nBytesPerSample;
        script.frames = params.nSampleRate;
        if (uri->getFileName()->startsWith("refuse"))
            script.onOpen = [] { throw sonora2::common::CSonoraError("not today"); };
        return peru::make<CFakeSource>(script, uri);
    };
    made->makeFormat = [](const P<peru::IURI>&, const CFakePlugin::SFormatParams& params) {
        return peru::make<CFakeFormat>(params);
    };
    plugin = made;
}
