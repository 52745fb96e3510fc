// Conversion and formatting of text.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

namespace host {

// The "file:" URI of a path, which need not be valid UTF-8; relative paths start at the current folder.
std::u16string toURI(const std::filesystem::path& path);
// Empty if the text is not valid UTF-8.
std::optional<std::u16string> toUTF16(const std::string& utf8);
// Unpaired surrogates become U+FFFD.
std::string toUTF8(const char16_t* text);
// Escapes control characters, including U+0080 to U+009F, as \xNN, for output to a terminal.
std::string toPrintable(std::string_view text);
// Replaces "file:" URIs in a message by paths.
std::string withPaths(std::string_view message);
// Rewords a reason that is shown after the name of the file concerned, so that it does not repeat the name.
std::string asReason(std::string message, const std::filesystem::path& about);
// The columns that the text takes on a terminal.
size_t countColumns(std::string_view text);
// Cuts the text, or pads it with spaces, to that number of terminal columns.
std::string fitColumns(std::string text, size_t columns);
void replaceAll(std::string& text, const std::string& what, const std::string& with);

// Flushes standard output. False if its reader has closed it; throws std::runtime_error for other errors.
bool flushOutput();
// The same for events during a job: the first error is stored for requireOutput. Thread-safe.
void flushEvents();
// Throws std::runtime_error if events could not be written, unless their reader has closed the output.
void requireOutput();

std::string formatDuration(double seconds); // 1:02:03.4
std::string formatSize(uint64_t bytes);     // 1.2 MB

} // namespace host
