// Texts across the boundary.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

namespace host {

// The "file:" URI of a path, which need not be valid UTF-8; a relative path counts from the current folder.
std::u16string toURI(const std::filesystem::path& path);
// Empty for bytes that are not UTF-8.
std::optional<std::u16string> toUTF16(const std::string& utf8);
// Unpaired surrogates become U+FFFD.
std::string toUTF8(const char16_t* text);
// For a line on a terminal: control characters, those from U+0080 to U+009F included, are shown as \xNN.
std::string toPrintable(std::string_view text);
// "file:" URIs within a message as the paths they stand for.
std::string withPaths(std::string_view message);
// A plug-in's reason as it reads behind the name of the file that it is about: that name is not told twice.
std::string asReason(std::string message, const std::filesystem::path& about);
// Cut, or filled with blanks, to so many columns of a terminal.
std::string fitColumns(std::string text, size_t columns);
void replaceAll(std::string& text, const std::string& what, const std::string& with);

// Of what was printed to standard output. False when its reader has left; throws std::runtime_error when it
// cannot be written.
bool flushOutput();
// The same for events in the middle of a job: a failure is kept for requireOutput. Any thread.
void flushEvents();
// Throws std::runtime_error when events could not be written, unless their reader has left.
void requireOutput();

std::string formatDuration(double seconds); // 1:02:03.4
std::string formatSize(uint64_t bytes);     // 1.2 MB

} // namespace host
