// What the desktop knows: types of files, its settings, its trash. In a library of its own (desktop/), since
// what it depends on takes longer to load than most jobs that never ask.
#pragma once

#include "peru/files/IFileType.h"

#include <string>
#include <vector>

namespace peru {

// Thread-safe.
class PERU_API IDesktop : public virtual IBase {
public:
    virtual P<IFileTypesManager> createFileTypesManager() = 0;
    // The MIME type that belongs to the file's name; the file is not opened. Empty if there is none.
    virtual std::string findKind(const std::string& path) = 0;
    // Moves the file or folder to the trash. If it returns false, `error` is the desktop's code, which may be
    // 0.
    virtual bool moveToTrash(const std::string& path, int& error) = 0;
    // The proxies for the URI in order of preference, "direct://" among them. May take long.
    virtual std::vector<std::string> findProxies(const std::string& uri) = 0;
    // The ASCII form of an international host name; empty if the text cannot be a name.
    virtual std::string toASCIIHost(const std::string& host) = 0;
};

// The function "peru_getDesktop" that the library exports.
inline constexpr const char* kGetDesktopName = "peru_getDesktop";

// Loads the library on first use. Throws CError if it is missing or cannot be loaded. Any thread.
PERU_API const P<IDesktop>& getDesktop();

} // namespace peru
