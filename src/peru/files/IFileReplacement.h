// New content for a file, until it replaces the old one.
#pragma once

#include "peru/streams/IStreams.h"

namespace peru {

// Created by ISystem::startReplacement. If the object is destroyed without a commit, nothing of the new
// content remains and the old file is unchanged. The same holds if the process dies, except that a hidden
// file stays behind where the file system does not support files without a name. Not thread-safe. Every
// operation throws CFileError, except that reading past the end of the stream throws CEndOfStreamError.
class PERU_API IFileReplacement : public virtual IBase {
public:
    // The new content, initially empty. Valid until commit.
    virtual P<ISeekableIOStream> getStream() = 0;
    // Copies `size` bytes from `offset` of the old file to the stream's position, inside the kernel where
    // possible. Throws if the old file is too short.
    virtual void copyFromOld(int64_t offset, int64_t size) = 0;
    // Writes the content to the disk and gives it the old file's name. Mode, extended attributes and, where
    // permitted, the owner are taken from the old file; symbolic links to it remain valid.
    virtual void commit() = 0;
};

} // namespace peru
