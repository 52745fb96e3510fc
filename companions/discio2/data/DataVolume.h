// The file system of a data disc.
#pragma once

#include "Error.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace discio {

// Consecutive blocks of 2048 bytes.
struct SDataExtent {
    int64_t block = -1; // -1: zeros that are not recorded
    int64_t bytes = 0;
};

struct SDataEntry {
    std::string name;   // UTF-8
    std::string stored; // the name in the form that the file system looks up
    bool isFolder = false;
    int64_t size = 0;
    // Seconds since 1970, -1 if unknown. The file systems of pressed discs record the last change only.
    int64_t created = -1;
    int64_t modified = -1;
    int64_t accessed = -1;
    std::string source; // the path of a file that is going to be written
    // The content of a file is in its extents, in their order; without them, in the entry itself.
    std::vector<SDataExtent> extents;
    std::string content;
    bool isReadable = true;
};

// Names of the folders from the root, in their stored form.
using DataPath = std::vector<std::string>;

// Any thread.
class IDataVolume {
public:
    virtual ~IDataVolume() = default;
    virtual std::string getTitle() = 0;
    virtual std::vector<SDataEntry> list(const DataPath& folder) = 0; // throws CDiscError
    // By its name as it is shown. Throws CDiscError.
    virtual std::optional<SDataEntry> find(const DataPath& folder, const std::string& name);
    // Throws CDiscError.
    virtual void readBlocks(int64_t block, int64_t count, void* to);
};

// ISO 9660 if there is one, otherwise UDF. Throws CDiscError.
std::shared_ptr<IDataVolume> openDataVolume(const std::string& path);

// The stored path of a folder that is named with "\" or "/" between its parts. Throws CDiscError if it does
// not exist.
DataPath findFolder(IDataVolume& volume, const std::string& path);

} // namespace discio
