// Commands that take several files.
#pragma once

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace host {

// Runs the job for each file; the job throws on failure, which is reported and does not stop the others. With
// EReader::needed the loop ends when the reader of standard output has closed it.
enum class EReader { needed, optional };
int forEachFile(const std::vector<std::filesystem::path>& files, bool json, EReader reader,
                const std::function<void(const std::filesystem::path&)>& job);

// "tonewright: FILE: REASON" on standard error.
void printFailure(const std::filesystem::path& file, const std::string& reason);

} // namespace host
