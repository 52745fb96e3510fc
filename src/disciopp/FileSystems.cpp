#include "disciopp/FileSystems.h"

#include "disciopp/Errors.h"
#include "peru/strings/StringFormat.h"

#include <charconv>

namespace disciopp {

using peru::CString;

namespace {

std::string getPath(const P<peru::IURI>& uri) {
    return CString::toStdString(uri->getUnescapedPath());
}

bool isSameOrigin(const P<peru::IURI>& one, const P<peru::IURI>& other) {
    return one->getScheme()->equals(other->getScheme()) && one->getAuthority()->equals(other->getAuthority());
}

P<peru::IURI> appendName(const P<peru::IURI>& folder, const std::string& name, bool isFolder) {
    return folder->appendPath(CString::fromUTF8(isFolder ? name + "/" : name));
}

P<IFileObject> makeRoot(const P<peru::IURI>& uri, ListChildren list) {
    return peru::make<CDiscFileObject>(uri, SEntry{"", true}, std::move(list));
}

// Everything in a folder of a data disc.
Children listFolder(const P<IDisc>& disc, const P<peru::IURI>& folder, const std::u16string& path) {
    const Handle<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(disc->getHandle(), path.c_str()));
    if (!cursor) throw CDISCIOPPException();
    Children children;
    while (DISCIO_DataCursorNext(cursor.get()) == 1) {
        SEntry entry;
        entry.name = CString::toStdString(peru::newString(DISCIO_DataCursorGetNameW(cursor.get())));
        entry.isFolder = DISCIO_DataCursorIsFolder(cursor.get()) == 1;
        entry.size = DISCIO_DataCursorGetSize(cursor.get());
        entry.modified = DISCIO_DataCursorGetLastModifiedTime(cursor.get());
        const P<peru::IURI> uri = appendName(folder, entry.name, entry.isFolder);
        ListChildren list;
        if (entry.isFolder)
            list = [disc, uri, inner = std::u16string(DISCIO_DataCursorGetDiscPathW(cursor.get()))] {
                return listFolder(disc, uri, inner);
            };
        children.push_back(peru::make<CDataDiscFileObject>(uri, entry, std::move(list)));
    }
    return children;
}

} // namespace

std::string getTrackFileName(int32_t number) {
    return CString::toStdString(peru::format(number < 10 ? "Track0%d.cda" : "Track%d.cda", number));
}

int32_t parseTrackFileName(std::string_view name) {
    constexpr std::string_view kStart = "Track", kEnd = ".cda";
    if (!name.starts_with(kStart) || !name.ends_with(kEnd) || name.size() < kStart.size() + kEnd.size())
        return 0;
    const std::string_view digits = name.substr(kStart.size(), name.size() - kStart.size() - kEnd.size());
    int32_t number = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return number > 0 && getTrackFileName(number) == name ? number : 0;
}

P<peru::IString> toDiscPath(const P<peru::IURI>& uri, const P<peru::IURI>& root) {
    std::string path = getPath(uri);
    bool isBelow = false;
    if (root) {
        const std::string base = getPath(root);
        isBelow = path.starts_with(base) && isSameOrigin(uri, root);
        if (isBelow) path.erase(0, base.size() - 1);
    }
    for (char& c : path)
        if (c == '/') c = '\\';
    if (path.ends_with('\\')) path.pop_back();
    if (isBelow && path.starts_with('\\')) path.erase(0, 1);
    return CString::fromUTF8(path);
}

CFileSystemBase::~CFileSystemBase() = default;

bool CFileSystemBase::handles(const P<peru::IURI>& uri) {
    return uri && isSameOrigin(uri, m_root) && getPath(uri->appendPath("")).starts_with(getPath(m_root));
}

P<peru::IFileObject> CFileSystemBase::getFileObject(const P<peru::IURI>& uri) {
    if (!handles(uri)) return nullptr;
    std::string rest = getPath(uri->appendPath("")).substr(getPath(m_root).size());
    P<peru::IFileObject> object = getRoot();
    while (object && !rest.empty()) {
        const std::string name = rest.substr(0, rest.find('/'));
        rest.erase(0, std::min(rest.size(), name.size() + 1));
        if (name.empty()) continue;
        if (!object->isFolder()) return nullptr;
        const P<peru::IFileObjectCursor> cursor = object->enumerate();
        object.reset();
        while (!object && cursor->next())
            if (cursor->getFileObject()->getName()->equals(CString::fromUTF8(name)))
                object = cursor->getFileObject();
    }
    return object;
}

P<peru::IFileObject> CDataDiscFileSystem::getRoot() {
    return makeRoot(m_root, [disc = m_disc, root = m_root] { return listFolder(disc, root, u""); });
}

P<peru::IFileObject> CAudioCDDiscFileSystem::getRoot() {
    return makeRoot(m_root, [disc = m_disc, root = m_root] {
        Children tracks;
        const int32_t count = disc->getSegmentCount();
        for (int32_t i = 0; i < count; ++i) {
            SEntry entry{getTrackFileName(i + 1)};
            if (const auto stream = disc->createStream(i))
                entry.size = stream->funcs->getFrameCount(stream->user) * 4;
            tracks.push_back(
                peru::make<CAudioCDDiscTrackFileObject>(appendName(root, entry.name, false), entry, disc, i));
        }
        return tracks;
    });
}

P<peru::IFileObject> CEmptyDiscFileSystem::getRoot() {
    return makeRoot(m_root, [] { return Children(); });
}

P<peru::IFileObject> CNoDiscFileSystem::getRoot() {
    return makeRoot(m_root, [] { return Children(); });
}

P<peru::IFileSystem> CDriveFileSystem::getCurrent() {
    if (const P<IDisc> disc = m_drive->getDisc()) return disc->getFileSystem();
    return peru::make<CNoDiscFileSystem>(m_root);
}

P<peru::IFileObject> CDriveFileSystem::getRoot() {
    const P<peru::IFileSystem> current = getCurrent();
    const std::string name = CString::toStdString(m_drive->getName());
    return peru::make<CDriveFileObject>(m_root, SEntry{name, true}, [current] {
        Children children;
        const P<peru::IFileObjectCursor> cursor = current->getRoot()->enumerate();
        while (cursor->next()) children.push_back(P<IFileObject>(cursor->getFileObject()));
        return children;
    });
}

P<peru::IFileObject> CDriveFileSystem::getFileObject(const P<peru::IURI>& uri) {
    return handles(uri) ? getCurrent()->getFileObject(uri) : nullptr;
}

} // namespace disciopp
