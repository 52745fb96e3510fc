// Where a result goes: a file that appears complete or not at all.
#pragma once

#include "Library.h"

#include <filesystem>
#include <string>

namespace host {

enum class EGrowth {
    hidden, // nothing is seen before the end
    live,   // what a killed run has written stays under the temporary name
};

class COutput {
public:
    // Throws std::runtime_error when the target exists and is not to be replaced, or cannot be replaced, and
    // for a temporary file that an earlier run has left, unless it may be replaced too.
    COutput(const std::filesystem::path& target, const std::string& suffix, bool replace,
            EGrowth growth = EGrowth::hidden);

    const std::filesystem::path& getTemporary() const { return m_temporary; }
    // Makes the file durable and gives it its name; a file that was there keeps its mode. Throws.
    void commit();
    // Leaves the temporary file, which the destructor otherwise removes.
    void keep();

private:
    CHandle m_output;
    std::filesystem::path m_temporary;
};

} // namespace host
