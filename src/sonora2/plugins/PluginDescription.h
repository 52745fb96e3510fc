// What a plug-in answers without being asked for media, stored in a file beside its library.
#pragma once

#include "sonora2/plugins/ISonoraPlugin.h"

#include <iosfwd>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace sonora2::common {

struct SPluginDescription {
    std::string buildId; // of the library that it describes
    std::string name;
    int types = 0;
    std::map<int, std::vector<std::string>> extensions; // in the plug-in's order, by mask of types

    bool operator==(const SPluginDescription&) const = default;
};

// Asks the plug-in, for all masks that a plug-in handler uses itself.
SONORA2_API SPluginDescription describePlugin(ISonoraPlugin& plugin, const std::string& buildId);

SONORA2_API void writeDescription(std::ostream& stream, const SPluginDescription& description);
// Empty if the stream does not hold a complete description.
SONORA2_API std::optional<SPluginDescription> readDescription(std::istream& stream);

// The description beside the library NAME.so, NAME.plugin. Empty if there is none or if it is that of another
// library: an older one, or one with another name.
SONORA2_API std::optional<SPluginDescription> findDescription(const std::string& library);

} // namespace sonora2::common
