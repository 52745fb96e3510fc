#include "disciopp/DataFileStream.h"

#include "disciopp/Discs.h"
#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "disciopp/IDrive.h"
#include "peru/Errors.h"
#include "peru/streams/StreamTools.h"

#include <cstring>
#include <filesystem>

namespace disciopp {

using peru::CString;

namespace {

constexpr const char* kImageScheme = "discioppdiscimage";
constexpr size_t kBufferBytes = size_t{32} << 10;

class CDataFileStream : public CBase, public peru::ISeekableInStream {
public:
    // The cursor stands on the file.
    CDataFileStream(const P<peru::IURI>& uri, Handle<DISCIO_DataCursor> cursor)
        : m_uri(uri), m_cursor(std::move(cursor)), m_size(DISCIO_DataCursorGetSize(m_cursor.get())) {}

    void close() override {
        m_cursor.reset();
        m_buffer.clear();
    }
    P<peru::IURI> getURI() const override { return m_uri; }
    bool isAtEnd() override {
        requireOpen();
        return m_position >= m_size;
    }
    void read(void* buffer, int64_t size) override { peru::readFully(*this, buffer, size); }
    int64_t readSome(void* buffer, int64_t size) override {
        peru::checkStreamSize(size, "CDataFileStream::readSome");
        requireOpen();
        if (m_position >= m_size) return 0;
        auto inside = m_position - m_start;
        if (inside < 0 || inside >= static_cast<int64_t>(m_buffer.size())) {
            if (size >= static_cast<int64_t>(kBufferBytes)) { // a detour would only copy
                const int64_t got = load(buffer, size);
                m_position += got;
                return got;
            }
            m_buffer.resize(kBufferBytes);
            m_start = m_position;
            int64_t got = 0;
            try {
                got = load(m_buffer.data(), kBufferBytes);
            } catch (...) {
                m_buffer.clear();
                throw;
            }
            m_buffer.resize(static_cast<size_t>(got));
            inside = 0;
        }
        const int64_t some = std::min(size, static_cast<int64_t>(m_buffer.size()) - inside);
        std::memcpy(buffer, m_buffer.data() + inside, static_cast<size_t>(some));
        m_position += some;
        return some;
    }
    void skip(int64_t size) override {
        peru::checkStreamSize(size, "CDataFileStream::skip");
        requireOpen();
        if (size > m_size - m_position) throw peru::CEndOfStreamError(m_uri);
        m_position += size;
    }
    void reset() override { seek(0); }
    int64_t getPosition() const override {
        requireOpen();
        return m_position;
    }
    void seek(int64_t position) override {
        peru::checkStreamSize(position, "CDataFileStream::seek");
        requireOpen();
        m_position = position;
    }
    int64_t getSize() const override {
        requireOpen();
        return m_size;
    }
    P<peru::IStreamMarker> createMarker() override {
        requireOpen();
        return peru::make<peru::CPositionMarker>(P<peru::ISeekableStream>::share(this));
    }

private:
    ~CDataFileStream() override = default;

    void requireOpen() const {
        if (!m_cursor) throw peru::CStreamClosedError(m_uri);
    }
    int64_t load(void* buffer, int64_t size) {
        const int64_t got = DISCIO_DataCursorRead(m_cursor.get(), m_position, buffer, size);
        if (got < 0) throw CDISCIOPPException();
        return got;
    }

    const P<peru::IURI> m_uri;
    Handle<DISCIO_DataCursor> m_cursor; // empty after close
    const int64_t m_size;
    int64_t m_position = 0; // may be behind the end
    int64_t m_start = 0;    // of the buffer in the file
    std::string m_buffer;
};

// `path` is the one on the disc.
P<peru::ISeekableInStream> openFile(DISCIO_Disc* disc, const std::u16string& path, const P<peru::IURI>& uri) {
    const size_t behind = path.find_last_of(u'\\') + 1; // 0 if there is none
    Handle<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(disc, path.substr(0, behind).c_str()));
    if (!cursor) {
        const int32_t code = DISCIO_GetLastError(nullptr);
        if (code == DISCIO_ERROR_NOT_FOUND || code == DISCIO_ERROR_NOT_A_FOLDER ||
            code == DISCIO_ERROR_NO_DATA)
            return nullptr;
        throw CDISCIOPPException();
    }
    const std::u16string name = path.substr(behind);
    while (DISCIO_DataCursorNext(cursor.get()) == 1)
        if (DISCIO_DataCursorGetNameW(cursor.get()) == name && DISCIO_DataCursorIsFile(cursor.get()) == 1)
            return peru::make<CDataFileStream>(uri, std::move(cursor));
    return nullptr;
}

P<peru::ISeekableInStream> openInImage(const P<peru::IURI>& uri) {
    const std::filesystem::path whole = CString::toStdString(uri->getUnescapedPath());
    std::filesystem::path image;
    for (auto part = whole.begin(); part != whole.end(); ++part) {
        image /= *part;
        std::error_code none;
        if (!std::filesystem::is_regular_file(image, none)) continue;
        std::string rest = whole.lexically_relative(image);
        const Handle<DISCIO_Library> library =
            openImage(CString::toStdU16String(CString::fromUTF8(image.native())));
        const Handle<DISCIO_Drive> drive(DISCIO_OpenDrive(library.get(), 0));
        const Handle<DISCIO_Disc> disc(DISCIO_DriveOpenDisc(drive.get()));
        if (!disc) throw CDISCIOPPException();
        std::replace(rest.begin(), rest.end(), '/', '\\');
        return openFile(disc.get(), CString::toStdU16String(CString::fromUTF8(rest)), uri);
    }
    return nullptr;
}

P<peru::ISeekableInStream> openInDrive(const P<peru::IURI>& uri) {
    const P<IDriveManager> manager = getDriveManager();
    for (int32_t i = 0; i < manager->getDriveCount(); ++i) {
        const P<IDrive> drive = manager->getDriveAt(i);
        if (!drive->getFileSystem()->handles(uri)) continue;
        const P<IDisc> disc = drive->getDisc();
        return disc ? openFile(disc->getHandle(), CString::toStdU16String(toDiscPath(uri, drive->getPath())),
                               uri)
                    : nullptr;
    }
    return nullptr;
}

} // namespace

P<peru::ISeekableInStream> tryOpenFile(const P<peru::IURI>& uri) {
    if (uri->getScheme()->equals(kImageScheme)) return openInImage(uri);
    return uri->getScheme()->equals("file") ? openInDrive(uri) : nullptr;
}

} // namespace disciopp
