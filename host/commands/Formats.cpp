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

} // namespace

int listFormats(CLibrary& library, const SFormatsOptions& options) {
    const Names read = getExtensions(library, TONEWRIGHT_AUDIO_SOURCE),
                written = getExtensions(library, TONEWRIGHT_AUDIO_FORMAT);
    Names all = read, tagged;
    all.insert(written.begin(), written.end());
    for (const std::string& name : all)
        if (canHaveTag("x." + name)) tagged.insert(name);
    if (options.json) {
        std::printf("%s\n", toLine({{"read", read}, {"write", written}, {"tag", tagged}}).c_str());
    } else if (options.table) {
        std::printf("%s\n", tr("host.Formats.header", "extension  read  write tag").c_str());
        const std::string yes = tr("host.Formats.yes", "yes");
        const auto mark = [&yes](const Names& names, const std::string& name) {
            return names.count(name) ? yes : "-";
        };
        for (const std::string& name : all)
            std::printf("%-10s %s %s %s\n", name.c_str(), fitColumns(mark(read, name), 5).c_str(),
                        fitColumns(mark(written, name), 5).c_str(), mark(tagged, name).c_str());
    } else {
        for (const std::string& name : read) std::printf("%s\n", name.c_str());
    }
    flushOutput();
    return read.empty() ? kExitFailure : kExitSuccess;
}

} // namespace host
