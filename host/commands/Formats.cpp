#include "commands/Formats.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/WholeTag.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <set>
#include <string>

namespace host {

namespace {

using Names = std::set<std::string>;

Names getExtensions(CLibrary& library, int32_t types) {
    const CHandle extensions(library.getValidCodecExtensions(types));
    Names names;
    for (int32_t i = 0; i < library.getExtensionCount(extensions.get()); ++i) {
        const CHandle text(library.getExtension(extensions.get(), i));
        if (text) names.insert(toUTF8(TONEWRIGHT_GetText(text.get())));
    }
    return names;
}

// The plug-ins that are asked first, by whether they read or write.
struct SPlugins {
    std::string reader;
    std::string writer;
    bool isBoxed = false;
};

SPlugins getPlugins(const std::string& extension) {
    SPlugins plugins;
    const auto ask = [&](int32_t type, std::string& name) {
        TONEWRIGHT_PluginInfo info = {};
        info.size = sizeof info;
        if (TONEWRIGHT_Host_GetPlugin(std::u16string(extension.begin(), extension.end()).c_str(), type,
                                      &info) != 1)
            return;
        name = info.plugin;
        plugins.isBoxed = plugins.isBoxed || info.isBoxed != 0;
    };
    ask(TONEWRIGHT_AUDIO_SOURCE, plugins.reader);
    ask(TONEWRIGHT_AUDIO_FORMAT, plugins.writer);
    return plugins;
}

} // namespace

int listFormats(CLibrary& library, const SFormatsOptions& options) {
    const Names read = getExtensions(library, TONEWRIGHT_AUDIO_SOURCE),
                written = getExtensions(library, TONEWRIGHT_AUDIO_FORMAT);
    Names all = read, tagged;
    all.insert(written.begin(), written.end());
    for (const std::string& name : all)
        if (canHaveTag("x." + name)) tagged.insert(name);
    if (options.json) {
        nlohmann::json plugins = nlohmann::json::object();
        for (const std::string& name : all) {
            const SPlugins each = getPlugins(name);
            plugins[name] = {{"boxed", each.isBoxed}};
            if (!each.reader.empty()) plugins[name]["read"] = each.reader;
            if (!each.writer.empty()) plugins[name]["write"] = each.writer;
        }
        std::printf(
            "%s\n",
            toLine({{"read", read}, {"write", written}, {"tag", tagged}, {"plugins", plugins}}).c_str());
    } else if (options.table) {
        std::printf("%s\n",
                    tr("host.Formats.header", "extension  read  write tag   boxed  plug-ins").c_str());
        const std::string yes = tr("host.Formats.yes", "yes");
        const auto mark = [&yes](bool is, size_t columns) { return fitColumns(is ? yes : "-", columns); };
        for (const std::string& name : all) {
            const SPlugins plugins = getPlugins(name);
            std::string names = plugins.reader.empty() ? plugins.writer : plugins.reader;
            if (!plugins.writer.empty() && plugins.writer != names) names += ", " + plugins.writer;
            std::printf("%-10s %s %s %s %s %s\n", name.c_str(), mark(read.count(name), 5).c_str(),
                        mark(written.count(name), 5).c_str(), mark(tagged.count(name), 5).c_str(),
                        mark(plugins.isBoxed, 6).c_str(), names.c_str());
        }
    } else {
        for (const std::string& name : read) std::printf("%s\n", name.c_str());
    }
    flushOutput();
    return read.empty() ? kExitFailure : kExitSuccess;
}

} // namespace host
