// Files that commands read and write.
#pragma once

#include "ced/Project.h"

#include <filesystem>
#include <string>
#include <string_view>

namespace host::covers {

using peru::P;

// Both throw exceptions with the reason, which does not name the file.
P<ced::CProject> openProject(const std::filesystem::path& file, bool hasFileNames);
std::string readFile(const std::filesystem::path& file);

// Throws std::runtime_error if the target is the source, is not a file, or exists and `force` is false.
void requireFree(const std::filesystem::path& target, bool force, const std::filesystem::path& source);
// The file appears complete, or an existing one remains unchanged. Throws std::runtime_error.
void writeFile(const std::filesystem::path& target, std::string_view bytes);

} // namespace host::covers
