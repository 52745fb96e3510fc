// An editor's arrangements: XML files that place parts of sound files on a time line.
#pragma once

#include "library/Library.h"
#include "media/SoundFile.h"

#include <filesystem>
#include <string>

namespace host {

// Judged by the extension.
bool isArrangement(const std::filesystem::path& file);

// The text in the form that the library takes: relative URIs are resolved against the arrangement's folder.
// Throws std::runtime_error if the file is not XML or a track has no URI.
std::u16string readArrangement(const std::filesystem::path& file);

// Returns a closed source. Throws std::runtime_error, also if the arrangement's duration is 0.
CHandle openArrangement(CLibrary& library, const std::filesystem::path& file, const SSampleFormat& samples);

} // namespace host
