// Where a result goes.
#pragma once

#include <filesystem>
#include <string>

namespace host {

// A file that appears complete or not at all: it is written under a temporary name beside its place.
class COutputPlace {
public:
    // Throws std::runtime_error when the target exists and is not to be replaced, or cannot be replaced;
    // likewise for a file of the temporary name, which an earlier run has left. Links are followed.
    COutputPlace(const std::filesystem::path& target, const std::string& temporaryEnding, bool replace);
    COutputPlace(const COutputPlace&) = delete;
    COutputPlace& operator=(const COutputPlace&) = delete;
    ~COutputPlace(); // removes the temporary file, unless committed or kept

    const std::filesystem::path& getTemporary() const { return m_temporary; }
    // Makes the file durable and gives it its name; what was there before keeps its mode. Throws.
    void commit();
    // Leaves the file under its temporary name.
    void keep() { m_committed = true; }

private:
    std::filesystem::path m_target;
    std::filesystem::path m_temporary;
    bool m_replace;
    bool m_committed = false;
};

} // namespace host
