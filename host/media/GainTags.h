// Fields of tags that tell players how much louder or quieter to play a file.
#pragma once

#include "media/Loudness.h"

#include <filesystem>
#include <optional>

namespace host {

// Sets the gain and the peak of the track and, if it is known, of its album: ReplayGain 2.0 (to -18 LUFS),
// and in Opus files the fields of RFC 7845 (to -23 LUFS). Fields of what cannot be measured are removed.
// Throws std::runtime_error.
void writeGainTags(const std::filesystem::path& file, const TONEWRIGHT_Loudness& track,
                   const std::optional<TONEWRIGHT_Loudness>& album);

// Removes all such fields. A file without a tag stays as it is. Throws std::runtime_error.
void removeGainTags(const std::filesystem::path& file);

} // namespace host
