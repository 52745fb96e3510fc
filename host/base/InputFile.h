// Files that commands read.
#pragma once

#include <filesystem>

namespace host {

// Throws std::runtime_error with the reason unless this is a readable regular file that is not empty.
void checkInput(const std::filesystem::path& file);

bool isSameFile(const std::filesystem::path& a, const std::filesystem::path& b);

} // namespace host
