// The contents of files on a data disc.
#pragma once

#include "data/DataVolume.h"

#include <string_view>

namespace discio {

// Copies bytes from that offset on. Returns how many; fewer only at the end of the file. Throws CDiscError.
int64_t readFile(IDataVolume& volume, const SDataEntry& entry, int64_t offset, void* buffer, int64_t bytes);

// Sets where the content of a UDF file is, from its file entry of one block. A file whose content is
// described in a way that is not supported is marked as not readable.
void setUdfExtents(SDataEntry& entry, std::string_view fileEntry, int64_t partitionStart);

} // namespace discio
