// Why a function of the library failed on this thread.
#pragma once

#include <filesystem>
#include <string>

namespace host {

void clearFailure();

// The reason of the last failure as a sentence, with paths in place of URIs, or `unknown` where the library
// gave none.
std::string takeFailure(const std::string& unknown);
// The same as it reads behind the name of the file that it is about.
std::string takeFailure(const std::string& unknown, const std::filesystem::path& about);

} // namespace host
