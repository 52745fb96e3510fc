#include "disciopp/FileObjects.h"

#include "disciopp/IDisc.h"
#include "peru/Errors.h"

#include <utility>

namespace disciopp {

CFileObject::CFileObject(const P<peru::IURI>& uri, const SEntry& entry, ListChildren list)
    : m_uri(uri), m_entry(entry), m_list(std::move(list)) {}
CFileObject::~CFileObject() = default;

P<peru::IString> CFileObject::getName() {
    return peru::CString::fromUTF8(m_entry.name);
}

P<peru::CFileTimes> CFileObject::getTimes() {
    constexpr int64_t kUnknown = peru::CFileTimes::kUnknown;
    constexpr int64_t kNanoseconds = 1'000'000'000;
    const bool isKnown = m_entry.modified >= 0 && m_entry.modified <= INT64_MAX / kNanoseconds;
    const int64_t written = isKnown ? m_entry.modified * kNanoseconds : kUnknown;
    return peru::make<peru::CFileTimes>(kUnknown, kUnknown, written);
}

peru::SFileAttributes CFileObject::getAttributes() {
    peru::SFileAttributes attributes;
    attributes.hidden = m_entry.name.starts_with('.');
    attributes.readOnly = true;
    return attributes;
}

P<peru::IString> CFileObject::getKind() {
    const char* kind = m_entry.isFolder                 ? "inode/directory"
                       : m_entry.name.ends_with(".cda") ? "application/x-cda"
                                                        : "application/octet-stream";
    return peru::newString(kind);
}

P<peru::IFileObjectCursor> CFileObject::enumerate() {
    if (!m_list) throw peru::CFileError("The file is not a folder", m_uri);
    return peru::make<CFileObjectCursor>(m_list());
}

CAudioCDDiscTrackFileObject::CAudioCDDiscTrackFileObject(const P<peru::IURI>& uri, const SEntry& entry,
                                                         const P<IAudioCDDisc>& disc, int32_t segment)
    : CFileObject(uri, entry, nullptr), m_disc(disc), m_segment(segment) {}
CAudioCDDiscTrackFileObject::~CAudioCDDiscTrackFileObject() = default;

Handle<DISCIO_PCMAudioStream> CAudioCDDiscTrackFileObject::createStream() {
    return m_disc->createStream(m_segment);
}

CFileObjectCursor::~CFileObjectCursor() = default;

bool CFileObjectCursor::next() {
    m_next = std::min(m_next, m_children.size()) + 1;
    return m_next <= m_children.size();
}

const P<IFileObject>& CFileObjectCursor::current() const {
    if (m_next == 0 || m_next > m_children.size())
        throw peru::CInvalidObjectStateError("The cursor is not on an entry",
                                             P<peru::IBase>::share(const_cast<CFileObjectCursor*>(this)));
    return m_children[m_next - 1];
}

} // namespace disciopp
