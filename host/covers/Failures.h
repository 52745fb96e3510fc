// Messages on standard error.
#pragma once

#include <exception>
#include <filesystem>
#include <functional>
#include <string>

namespace host::covers {

// "tonewright-covers: FILE: REASON"
void printFailure(const std::filesystem::path& file, const std::string& reason);
// A sentence to follow the file's name, which it does not repeat.
std::string getReason(const std::exception& error, const std::filesystem::path& file);

// Runs the work on a file and returns an exit code. A failure is printed, as a line of JSON on standard
// output if that is what the command prints. So are, on standard error, the warnings that the module logs
// meanwhile, such as missing pictures, each once.
int runForFile(const std::filesystem::path& file, const std::function<void()>& work, bool isJson = false);

} // namespace host::covers
