// Arrangements of an editor: XML files that tell which parts of which sounds are heard when.
#pragma once

#include "Library.h"
#include "SoundFile.h"

#include <filesystem>
#include <string>

namespace host {

// By its extension.
bool isArrangement(const std::filesystem::path& file);

// The text as the library takes it: media whose URI is relative are those beside the arrangement's file.
// Throws std::runtime_error when it is no XML, or a track names no medium.
std::u16string readArrangement(const std::filesystem::path& file);

// The closed source of it. Throws std::runtime_error, also when nothing in it would be heard.
CHandle openArrangement(CLibrary& library, const std::filesystem::path& file, const SSampleFormat& samples);

} // namespace host
