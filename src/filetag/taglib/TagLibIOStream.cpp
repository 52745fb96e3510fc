#include "filetag/taglib/TagLibIOStream.h"

#include "filetag/posix/OpenedFile.h"
#include "peru/Errors.h"
#include "peru/streams/IStreamManager.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <algorithm>
#include <limits>

namespace filetag::taglib {
namespace {

using namespace peru;

// Size of a page in the page cache: a write within one page happens completely or not at all.
constexpr int64_t kPageSize = 4096;
// Shorter ranges of the old file are copied through memory, longer ones inside the kernel.
constexpr int64_t kCopiedInside = 128 * 1024;

std::string_view toView(const TagLib::ByteVector& bytes) {
    return {bytes.data(), bytes.size()};
}

[[noreturn]] void failToRead(const P<IURI>& file) {
    throw CFileError(localize("filetag.CTagLibIOStream.ReadError", "The file '%FILE%' could not be read.",
                              {{"%FILE%", getShownName(file)}}),
                     file);
}

} // namespace

CTagLibIOStream::CTagLibIOStream(const P<IURI>& file, posix::EAccess access)
    : m_uri(file), m_opened(std::make_unique<posix::COpenedFile>(file, access)),
      m_path(CString::toStdString(getPathes()->toPlatformPath(file))), m_file(m_opened->duplicate(), true),
      m_oldSize(m_file.length()) {}

CTagLibIOStream::~CTagLibIOStream() = default;

TagLib::FileName CTagLibIOStream::name() const {
    return m_path.c_str();
}

TagLib::ByteVector CTagLibIOStream::readBlock(unsigned long length) {
    if (!m_pieces) {
        const int64_t end = std::max<int64_t>(m_oldSize - m_file.tell(), 0);
        const TagLib::ByteVector bytes = m_file.readBlock(length);
        // TagLib would take this for the end of the file, and a store would lose the rest of the tag.
        if (bytes.size() < std::min<uint64_t>(length, static_cast<uint64_t>(end))) failToRead(m_uri);
        return bytes;
    }
    const int64_t left = std::max<int64_t>(m_pieces->getSize() - m_position, 0);
    const int64_t end =
        m_position + (length < static_cast<unsigned long>(left) ? static_cast<int64_t>(length) : left);
    const std::string bytes = readNew({m_position, end});
    m_position += static_cast<int64_t>(bytes.size());
    return TagLib::ByteVector(bytes.data(), static_cast<unsigned int>(bytes.size()));
}

// The first change takes over the position from the file.
void CTagLibIOStream::writeBlock(const TagLib::ByteVector& data) {
    m_position = tell();
    change().write(m_position, toView(data));
    m_position += static_cast<int64_t>(data.size());
}

void CTagLibIOStream::insert(const TagLib::ByteVector& data, unsigned long start, unsigned long replace) {
    change().insert(static_cast<int64_t>(start), toView(data), static_cast<int64_t>(replace));
    m_position = static_cast<int64_t>(start) + static_cast<int64_t>(data.size());
}

void CTagLibIOStream::removeBlock(unsigned long start, unsigned long length) {
    change().insert(static_cast<int64_t>(start), {}, static_cast<int64_t>(length));
    m_position = static_cast<int64_t>(start);
}

bool CTagLibIOStream::readOnly() const {
    return false;
}

bool CTagLibIOStream::isOpen() const {
    return m_file.isOpen();
}

void CTagLibIOStream::seek(long offset, Position from) {
    if (!m_pieces) return m_file.seek(offset, from);
    if (from == Current) offset += m_position;
    if (from == End) offset += m_pieces->getSize();
    m_position = std::max(offset, 0L);
}

void CTagLibIOStream::clear() {
    m_file.clear();
}

long CTagLibIOStream::tell() const {
    return m_pieces ? m_position : m_file.tell();
}

// TagLib calls this often, and its own stream would seek to the end and back every time.
long CTagLibIOStream::length() {
    return m_pieces ? m_pieces->getSize() : m_oldSize;
}

void CTagLibIOStream::truncate(long length) {
    m_position = tell();
    change().setSize(length);
}

CPieceTable& CTagLibIOStream::change() {
    if (!m_pieces) m_pieces.emplace(m_oldSize);
    return *m_pieces;
}

std::string CTagLibIOStream::readOld(int64_t offset, int64_t size) {
    m_file.seek(offset, Beginning);
    const TagLib::ByteVector bytes = m_file.readBlock(static_cast<unsigned long>(size));
    if (bytes.size() != static_cast<uint64_t>(size)) failToRead(m_uri);
    return std::string(bytes.data(), bytes.size());
}

std::string CTagLibIOStream::readNew(const SRange& range) {
    std::string bytes;
    int64_t position = range.start;
    for (auto entry = m_pieces->find(position); position < range.end; ++entry) {
        CPieceTable::SPiece part = entry->second;
        const int64_t passed = position - entry->first;
        part.source += passed;
        part.size = std::min(part.size - passed, range.end - position);
        if (part.isNew)
            bytes += m_pieces->getBytes(part);
        else
            bytes += readOld(part.source, part.size);
        position += part.size;
    }
    return bytes;
}

CTagLibIOStream::SRange CTagLibIOStream::findDifference() {
    SRange range{std::numeric_limits<int64_t>::max(), 0};
    for (const auto& [position, piece] : m_pieces->getPieces()) {
        if (!piece.isNew && piece.source == position) continue;
        int64_t first = 0;
        int64_t end = piece.size;
        if (piece.isNew) {
            const std::string old = readOld(position, piece.size);
            const std::string_view bytes = m_pieces->getBytes(piece);
            while (first < end && bytes[static_cast<size_t>(first)] == old[static_cast<size_t>(first)])
                ++first;
            if (first == end) continue;
            while (bytes[static_cast<size_t>(end - 1)] == old[static_cast<size_t>(end - 1)]) --end;
        }
        range.start = std::min(range.start, position + first);
        range.end = std::max(range.end, position + end);
    }
    return range;
}

// Does not sync, which would take twenty times as long as everything else: after a power failure the page is
// either the old or the new one, and both contain a complete tag.
void CTagLibIOStream::writePage(const SRange& range) {
    const auto write = [&](const std::string& bytes) {
        const P<ISeekableIOStream> stream = getStreamManager()->getSeekableIOStream(m_uri, EOpenMode::open);
        stream->seek(range.start);
        stream->write(bytes.data(), static_cast<int64_t>(bytes.size()));
        stream->close();
    };
    const std::string bytes = readNew(range);
    const std::string old = readOld(range.start, range.end - range.start);
    try {
        write(bytes);
    } catch (const CStreamError& error) {
        try {
            write(old);
        } catch (const CException&) {
            // Either nothing was written or the medium no longer accepts writes; report the first error.
        }
        throw CFileError(error.getDescription(), m_uri);
    }
}

void CTagLibIOStream::replaceFile() {
    const P<IFileReplacement> replacement = getSystem()->startReplacement(m_uri);
    const P<ISeekableIOStream> stream = replacement->getStream();
    for (const auto& [position, piece] : m_pieces->getPieces()) {
        if (!piece.isNew && piece.size >= kCopiedInside) {
            replacement->copyFromOld(piece.source, piece.size);
            continue;
        }
        const std::string bytes =
            piece.isNew ? std::string(m_pieces->getBytes(piece)) : readOld(piece.source, piece.size);
        stream->write(bytes.data(), piece.size);
    }
    replacement->commit();
}

void CTagLibIOStream::commit(bool certain) {
    if (!m_pieces || !m_pieces->isChanged()) return;
    // The pieces refer to the file that was opened; combined with any other they would corrupt it.
    const posix::COpenedFile::CLock lock(*m_opened);
    m_opened->checkUnchanged();
    if (certain && !m_opened->isCertain()) throw posix::CFileChangedError(m_uri);
    if (m_pieces->getSize() == m_oldSize) {
        const SRange range = findDifference();
        if (range.end == 0) return;
        if (range.start / kPageSize == (range.end - 1) / kPageSize) return writePage(range);
    }
    replaceFile();
}

} // namespace filetag::taglib
