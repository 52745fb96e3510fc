#include "data/DataFile.h"
#include "exports/Handles.h"

using namespace discio;

int64_t DISCIO_DataCursorRead(DISCIO_DataCursor* cursor, int64_t offset, void* buffer, int64_t bytes) {
    return barrier<int64_t>(-1, [&] {
        const DISCIO_DataCursor& own = require(cursor);
        if (offset < 0 || bytes < 0 || (!buffer && bytes > 0))
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
        if (own.next == 0 || own.next > own.entries.size())
            throw CDiscError(DISCIO_ERROR_NOT_PREPARED, "the cursor is not on an entry");
        return readFile(own.disc->getVolume(), own.entries[own.next - 1], offset, buffer, bytes);
    });
}
