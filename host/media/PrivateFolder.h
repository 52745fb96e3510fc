// A temporary folder of this process.
#pragma once

#include <filesystem>

namespace host {

// In $TMPDIR; only this user can look into it. The destructor removes it with everything in it.
class CPrivateFolder {
public:
    CPrivateFolder(); // throws std::runtime_error
    ~CPrivateFolder();
    CPrivateFolder(const CPrivateFolder&) = delete;
    CPrivateFolder& operator=(const CPrivateFolder&) = delete;

    const std::filesystem::path& getPath() const { return m_path; }

private:
    std::filesystem::path m_path;
};

} // namespace host
