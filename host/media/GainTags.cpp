#include "media/GainTags.h"

#include "base/Text.h"
#include "library/Failure.h"
#include "media/WholeTag.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstdio>
#include <string>

namespace host {

namespace {

constexpr double kReplayGainTarget = -18.0, kOpusTarget = -23.0; // LUFS
constexpr double kOpusSteps = 256.0;                             // per decibel

// `kind` is TRACK or ALBUM.
void setGain(CTagChange& change, bool isOpus, const std::string& kind, const TONEWRIGHT_Loudness& loudness) {
    char gain[32] = "", peak[32] = "";
    if (isMeasurable(loudness)) {
        if (isOpus)
            std::snprintf(gain, sizeof gain, "%ld",
                          std::lround((kOpusTarget - loudness.integrated) * kOpusSteps));
        else
            std::snprintf(gain, sizeof gain, "%.2f dB", kReplayGainTarget - loudness.integrated);
        std::snprintf(peak, sizeof peak, "%.6f", loudness.truePeak);
    }
    if (isOpus) return change.setField("R128_" + kind + "_GAIN", gain);
    change.setField("REPLAYGAIN_" + kind + "_GAIN", gain);
    change.setField("REPLAYGAIN_" + kind + "_PEAK", peak);
}

} // namespace

void writeGainTags(const std::filesystem::path& file, const TONEWRIGHT_Loudness& track,
                   const std::optional<TONEWRIGHT_Loudness>& album) {
    checkTagged(file);
    const bool isOpus = hasExtension(file, {".opus"});
    CTagChange change;
    setGain(change, isOpus, "TRACK", track);
    if (album) setGain(change, isOpus, "ALBUM", *album);
    change.apply(file);
}

// The file may have a temporary name, by which only the library recognises its format.
void removeGainTags(const std::filesystem::path& file) {
    const CHandle tags(TONEWRIGHT_Host_ReadTags(toURI(file).c_str()));
    clearFailure();
    CTagChange change;
    bool isFound = false;
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetTagEntryCount(tags.get()); ++i) {
        const char* field = "";
        if (TONEWRIGHT_Host_GetTagEntry(tags.get(), i, &field, nullptr) != 1) continue;
        std::string name = field;
        std::transform(name.begin(), name.end(), name.begin(),
                       [](unsigned char c) { return std::toupper(c); });
        if (name.find("REPLAYGAIN_") == std::string::npos && !name.starts_with("R128_")) continue;
        change.setField(field, "");
        isFound = true;
    }
    if (isFound) change.apply(file);
}

} // namespace host
