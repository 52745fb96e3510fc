#include "sonora2/plugins/PluginDescription.h"

#include "sonora2/plugins/BuildId.h"

#include <filesystem>
#include <fstream>
#include <sstream>

namespace sonora2::common {

namespace {

constexpr int kMasks[] = {kVideoSource, kAudioSource, kVideoSource | kAudioSource,
                          kVideoFormat, kAudioFormat, kVideoFormat | kAudioFormat,
                          kPluginObject};
constexpr const char* kHeader = "plugin 1"; // with the version of the form
constexpr const char* kEnd = "end";

} // namespace

SPluginDescription describePlugin(ISonoraPlugin& plugin, const std::string& buildId) {
    SPluginDescription description;
    description.buildId = buildId;
    description.name = peru::CString::toStdString(plugin.getPluginName());
    description.types = plugin.getValidTypes();
    for (const int mask : kMasks) {
        std::vector<std::string>& extensions = description.extensions[mask];
        const P<IPluginExtensions> list = plugin.getValidExtensions(mask);
        for (int i = 0; list && i < list->getCount(); ++i)
            extensions.push_back(peru::CString::toStdString(list->getExtension(i)));
    }
    return description;
}

void writeDescription(std::ostream& stream, const SPluginDescription& description) {
    stream << kHeader << '\n'
           << description.buildId << '\n'
           << description.name << '\n'
           << description.types << '\n';
    for (const auto& [mask, extensions] : description.extensions) {
        stream << mask;
        for (const std::string& extension : extensions) stream << ' ' << extension;
        stream << '\n';
    }
    stream << kEnd << '\n';
}

std::optional<SPluginDescription> readDescription(std::istream& stream) {
    SPluginDescription description;
    std::string line;
    if (!std::getline(stream, line) || line != kHeader) return {};
    if (!std::getline(stream, description.buildId) || !std::getline(stream, description.name)) return {};
    if (!(stream >> description.types >> std::ws)) return {};
    while (std::getline(stream, line)) {
        if (line == kEnd) return description;
        std::istringstream words(line);
        int mask = 0;
        if (!(words >> mask)) return {};
        std::vector<std::string>& extensions = description.extensions[mask];
        for (std::string extension; words >> extension;) extensions.push_back(extension);
    }
    return {};
}

std::optional<SPluginDescription> findDescription(const std::string& library) {
    const std::filesystem::path path = library;
    std::ifstream stream(std::filesystem::path(path).replace_extension(".plugin"));
    if (!stream) return {};
    std::optional<SPluginDescription> found = readDescription(stream);
    if (!found || found->buildId.empty() || found->name != path.stem().string()) return {};
    if (found->buildId != getBuildId(library)) return {};
    return found;
}

} // namespace sonora2::common
