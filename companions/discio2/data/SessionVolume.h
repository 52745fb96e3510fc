// The file system of a data track that does not start where its file or device does.
#pragma once

#include "Medium.h"
#include "data/DataVolume.h"

namespace discio {

// ISO 9660 at a block of the disc, read at once with all its folders. Throws CDiscError.
std::shared_ptr<IDataVolume> openSessionVolume(std::unique_ptr<IDataReader> reader, int32_t start);

} // namespace discio
