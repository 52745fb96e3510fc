#include "media/FormatOptions.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/SoundFile.h"

#include <tonewright/host.h>

namespace host {

void requireEffect(const SFormatOptions& options, const std::filesystem::path& target) {
    const struct {
        bool isSet;
        uint32_t setting;
        const char* option;
        std::string reason;
    } checks[] = {
        {options.quality.has_value(), TONEWRIGHT_SETTING_QUALITY, "--quality",
         tr("host.Effect.quality", "their samples are stored as they are")},
        {options.bitRate > 0, TONEWRIGHT_SETTING_BIT_RATE, "--bitrate",
         tr("host.Effect.bitRate", "their size follows from the sound")},
        {options.bits.has_value(), TONEWRIGHT_SETTING_WIDTH, "--bits",
         tr("host.Effect.bits", "the codec has no fixed number of bits per sample")},
    };
    bool hasWork = false;
    for (const auto& check : checks) hasWork = hasWork || check.isSet;
    if (!hasWork) return;
    TONEWRIGHT_Capabilities capabilities = {};
    capabilities.size = sizeof capabilities;
    const bool isKnown = TONEWRIGHT_Host_GetCapabilities(toURI(target).c_str(), &capabilities) == 1;
    clearFailure();
    if (!isKnown) return;
    for (const auto& check : checks)
        if (check.isSet && !(capabilities.settings & check.setting))
            throw CUsageError(tr(
                "host.Effect.none", "%OPTION% has no effect on %KIND%: %REASON%",
                {{"%OPTION%", check.option}, {"%KIND%", describeKind(target)}, {"%REASON%", check.reason}}));
}

} // namespace host
