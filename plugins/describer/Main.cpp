// plugin_describer LIBRARY: writes what the plug-in answers about itself to LIBRARY's name with .plugin, from
// where a plug-in handler reads it.
#include "peru/system/IPathes.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/plugins/BuildId.h"
#include "sonora2/plugins/PluginDescription.h"
#include "sonora2/plugins/PluginModule.h"

#include <cstdio>
#include <filesystem>
#include <fstream>

namespace {

using namespace sonora2::common;

void describe(const std::filesystem::path& library) {
    const std::string buildId = getBuildId(library);
    if (buildId.empty()) throw CSonoraError("the library has no build ID");
    const P<ISonoraContext> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    const auto module =
        peru::make<CPluginModule>(context, peru::getPathes()->fromPlatformPath(library.c_str()));
    std::ofstream stream(std::filesystem::path(library).replace_extension(".plugin"));
    writeDescription(stream, describePlugin(*module, buildId));
    if (!stream.flush()) throw CSonoraError("the description cannot be written");
}

} // namespace

#ifdef TONEWRIGHT_SANITIZED
// A part of the build; leaks are the tests' concern.
extern "C" __attribute__((visibility("default"))) const char* __asan_default_options() {
    return "detect_leaks=0";
}
#endif

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fputs("usage: plugin_describer LIBRARY\n", stderr);
        return 2;
    }
    try {
        describe(std::filesystem::absolute(argv[1]));
        return 0;
    } catch (const peru::CException& e) {
        std::fprintf(stderr, "%s: %s\n", argv[1], peru::CString::toStdString(e.getDescription()).c_str());
    } catch (const std::exception& e) {
        std::fprintf(stderr, "%s: %s\n", argv[1], e.what());
    }
    return 1;
}
