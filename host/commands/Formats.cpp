#include "commands/Formats.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <set>
#include <string>

namespace host {

int listFormats(CLibrary& library, bool json) {
    CHandle extensions(library.getValidCodecExtensions(TONEWRIGHT_AUDIO_SOURCE));
    std::set<std::string> names;
    for (int32_t i = 0; i < library.getExtensionCount(extensions.get()); ++i) {
        CHandle text(library.getExtension(extensions.get(), i));
        if (text) names.insert(toUTF8(TONEWRIGHT_GetText(text.get())));
    }
    if (json) {
        std::printf("%s\n", toLine({{"read", names}}).c_str());
    } else {
        for (const std::string& name : names) std::printf("%s\n", name.c_str());
    }
    flushOutput();
    return names.empty() ? kExitFailure : kExitSuccess;
}

} // namespace host
