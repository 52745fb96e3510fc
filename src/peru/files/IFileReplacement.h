// A file's new content, on its way to take the place of the old one.
#pragma once

#include "peru/streams/IStreams.h"

namespace peru {

// Made by ISystem::startReplacement. The new content has no name until commit; when the object goes without
// one, or the process dies, nothing of it is left and the old file stands as it was. One thread at a time.
// Everything throws CFileError; only reading behind the end of the stream throws what it throws elsewhere.
class PERU_API IFileReplacement : public virtual IBase {
public:
    // Where the new content is written; empty at first. Valid until commit.
    virtual P<ISeekableIOStream> getStream() = 0;
    // Writes `size` bytes of the old file, from `offset` on, at the stream's position, inside the system and
    // not through this program's memory where that is possible. Throws when the old file ends before them.
    virtual void copyFromOld(int64_t offset, int64_t size) = 0;
    // Brings the content onto the medium and gives it the old file's name. Mode, extended attributes and,
    // where allowed, owner are the old file's; symbolic links to it stay.
    virtual void commit() = 0;
};

} // namespace peru
