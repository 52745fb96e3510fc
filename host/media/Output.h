// An output file that appears complete or not at all.
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <string>

namespace host {

enum class EGrowth {
    hidden, // the temporary file is empty until the result is complete
    live,   // the temporary file grows, and remains if the process is killed
};

// Creates a folder and those above it that are missing; the empty path stands for the current folder. Throws
// std::runtime_error with the reason.
void createFolders(const std::filesystem::path& folder);

class COutput {
public:
    // Throws std::runtime_error if the target exists and `replace` is false, if it cannot be replaced, and if
    // an earlier run has left a temporary file, unless `replace` is true.
    COutput(const std::filesystem::path& target, const std::string& suffix, bool replace,
            EGrowth growth = EGrowth::hidden);

    const std::filesystem::path& getTemporary() const { return m_temporary; }
    // Writes the file to the disk and renames it to the target; a replaced file's mode is preserved. Throws
    // std::runtime_error.
    void commit();
    // Keeps the temporary file, which the destructor would otherwise remove.
    void keep();

private:
    CHandle m_output;
    std::filesystem::path m_temporary;
};

} // namespace host
