// The reason why a function of the library failed on this thread.
#pragma once

#include <filesystem>
#include <string>

namespace host {

void clearFailure();

// Returns the reason of the last failure as a sentence, with paths in place of URIs, or `unknown` if the
// library reported none; and clears it.
std::string takeFailure(const std::string& unknown);
// The same, worded to follow the name of the file concerned; see asReason().
std::string takeFailure(const std::string& unknown, const std::filesystem::path& about);

} // namespace host
