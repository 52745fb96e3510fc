#include "data/SessionVolume.h"
#include "exports/Handles.h"
#include "projects/SourcePath.h"

#include <algorithm>

using namespace discio;

namespace discio {

IDataVolume& SDisc::getVolume() {
    std::lock_guard lock(mutex);
    if (!volume) {
        const STrack* track = medium->findDataTrack();
        if (!track) throw CDiscError(DISCIO_ERROR_NO_DATA, "");
        const std::string path = medium->getDataPath();
        // The addresses in a file of its own may count from the start of the disc, too.
        if (track->start > 0 || path.empty()) {
            try {
                volume = openSessionVolume(medium->createDataReader(), track->start);
            } catch (const CDiscError&) {
                if (path.empty()) throw;
            }
        }
        if (!volume) volume = openDataVolume(path);
    }
    return *volume;
}

} // namespace discio

namespace {

// A path with "\" in front of every part and at its end.
std::string normalise(const std::string& path) {
    std::string shown = "\\";
    for (const char c : path)
        if (c != '\\' && c != '/')
            shown += c;
        else if (shown.back() != '\\')
            shown += '\\';
    if (shown.back() != '\\') shown += '\\';
    return shown;
}

DISCIO_DataCursor* makeCursor(const std::shared_ptr<SDisc>& disc, const DataPath& stored,
                              const std::string& path) {
    std::vector<SDataEntry> entries = disc->getVolume().list(stored);
    DISCIO_DataCursor* cursor = makeHandle<DISCIO_DataCursor>(EKind::cursor);
    cursor->disc = disc;
    cursor->stored = stored;
    cursor->path = path;
    cursor->entries = std::move(entries);
    return cursor;
}

const SDataEntry& requireEntry(DISCIO_DataCursor* cursor) {
    const DISCIO_DataCursor& own = require(cursor);
    if (own.next == 0 || own.next > own.entries.size())
        throw CDiscError(DISCIO_ERROR_NOT_PREPARED, "the cursor is not on an entry");
    return own.entries[own.next - 1];
}

std::string fromText(const char16_t* text) {
    if (!text) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return toUTF8(text);
}

} // namespace

const char16_t* DISCIO_DiscDataGetTitleW(DISCIO_Disc* disc) {
    return barrier<const char16_t*>(nullptr, [&] {
        DISCIO_Disc& own = require(disc);
        return own.texts.hold(&own.kind, own.disc->getVolume().getTitle());
    });
}

DISCIO_DataCursor* DISCIO_DiscDataCreateCursorW(DISCIO_Disc* disc, const char16_t* folder) {
    return barrier<DISCIO_DataCursor*>(nullptr, [&] {
        const auto& own = require(disc).disc;
        const std::string path = fromText(folder);
        return makeCursor(own, findFolder(own->getVolume(), path), normalise(path));
    });
}

int32_t DISCIO_DiscDataFolderExistsW(DISCIO_Disc* disc, const char16_t* folder) {
    return barrier<int32_t>(0, [&] {
        findFolder(require(disc).disc->getVolume(), fromText(folder));
        return 1;
    });
}

int32_t DISCIO_DataCursorNext(DISCIO_DataCursor* cursor) {
    return barrier<int32_t>(0, [&] {
        DISCIO_DataCursor& own = require(cursor);
        own.next = std::min(own.next, own.entries.size()) + 1;
        return own.next <= own.entries.size();
    });
}

int32_t DISCIO_DataCursorReset(DISCIO_DataCursor* cursor) {
    return barrier<int32_t>(0, [&] {
        require(cursor).next = 0;
        return 1;
    });
}

DISCIO_DataCursor* DISCIO_DataCursorCreateSubCursor(DISCIO_DataCursor* cursor) {
    return barrier<DISCIO_DataCursor*>(nullptr, [&] {
        const SDataEntry& entry = requireEntry(cursor);
        if (!entry.isFolder) throw CDiscError(DISCIO_ERROR_NOT_A_FOLDER, entry.name);
        DataPath stored = cursor->stored;
        stored.push_back(entry.stored);
        return makeCursor(cursor->disc, stored, cursor->path + entry.name + "\\");
    });
}

int32_t DISCIO_DataCursorIsFile(DISCIO_DataCursor* cursor) {
    return barrier<int32_t>(0, [&] { return !requireEntry(cursor).isFolder; });
}

int32_t DISCIO_DataCursorIsFolder(DISCIO_DataCursor* cursor) {
    return barrier<int32_t>(0, [&] { return requireEntry(cursor).isFolder; });
}

const char16_t* DISCIO_DataCursorGetNameW(DISCIO_DataCursor* cursor) {
    return barrier<const char16_t*>(nullptr, [&] {
        const SDataEntry& entry = requireEntry(cursor);
        return cursor->texts.hold(&cursor->disc, entry.name);
    });
}

int64_t DISCIO_DataCursorGetSize(DISCIO_DataCursor* cursor) {
    return barrier<int64_t>(-1, [&] { return requireEntry(cursor).size; });
}

const char16_t* DISCIO_DataCursorGetDiscPathW(DISCIO_DataCursor* cursor) {
    return barrier<const char16_t*>(nullptr, [&] {
        const SDataEntry& entry = requireEntry(cursor);
        return cursor->texts.hold(&cursor->path, cursor->path + entry.name);
    });
}

const char16_t* DISCIO_DataCursorGetFileSourceURIW(DISCIO_DataCursor* cursor) {
    return barrier<const char16_t*>(nullptr, [&] {
        const std::string& source = requireEntry(cursor).source;
        return cursor->texts.hold(&cursor->entries, source.empty() ? source : toFileURI(source));
    });
}

int64_t DISCIO_DataCursorGetCreatedTime(DISCIO_DataCursor* cursor) {
    return barrier<int64_t>(-1, [&] { return requireEntry(cursor).created; });
}

int64_t DISCIO_DataCursorGetLastModifiedTime(DISCIO_DataCursor* cursor) {
    return barrier<int64_t>(-1, [&] { return requireEntry(cursor).modified; });
}

int64_t DISCIO_DataCursorGetLastAccessedTime(DISCIO_DataCursor* cursor) {
    return barrier<int64_t>(-1, [&] { return requireEntry(cursor).accessed; });
}
