// Inputs whose names do not show their format.
#pragma once

#include "media/PrivateFolder.h"

#include <filesystem>
#include <optional>
#include <string>

namespace host {

// "-" stands for standard input or output; a file of that name is "./-".
bool isStandardStream(const std::filesystem::path& file);

// The extension of the file's format, such as ".flac", judged by its first bytes; empty if the format is not
// known.
std::string detectExtension(const std::filesystem::path& file);

// The file to open for an input. Since the library chooses the decoder by the extension, an input without one
// is opened through a link that has the extension of its format. Decoders read back and forth, so standard
// input, and the content of a web address, are copied to a temporary file first. All of these are in a
// private folder, which the destructor removes.
class CInputContent {
public:
    // Throws std::runtime_error. After Ctrl-C a copy may be incomplete.
    explicit CInputContent(const std::filesystem::path& input);

    const std::filesystem::path& getPath() const { return m_path; }

private:
    void copyStandardInput();
    void nameCopy(const std::filesystem::path& extension);

    std::optional<CPrivateFolder> m_folder;
    std::filesystem::path m_path;
};

// Writes the file to standard output. False if the reader closed it or Ctrl-C ended it; throws
// std::runtime_error for other errors.
bool copyToStandardOutput(const std::filesystem::path& file);

} // namespace host
