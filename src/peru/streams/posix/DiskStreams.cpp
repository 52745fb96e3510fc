#include "peru/streams/posix/DiskStreams.h"

namespace peru::posix {

CDiskInStream::CDiskInStream(const P<IURI>& uri)
    : TDiskStream(CDiskFile::open(uri, EAccess::read, EOpenMode::open)) {}

CDiskInStream::~CDiskInStream() = default;

void CDiskInStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CDiskInStream::readSome(void* buffer, int64_t size) {
    return m_file->readSome(buffer, size);
}

void CDiskInStream::skip(int64_t size) {
    m_file->skip(size);
}

CDiskOutStream::CDiskOutStream(const P<IURI>& uri, EOpenMode mode)
    : TDiskStream(CDiskFile::open(uri, EAccess::write, mode)) {}

CDiskOutStream::~CDiskOutStream() = default;

void CDiskOutStream::write(const void* buffer, int64_t size) {
    m_file->write(buffer, size);
}

void CDiskOutStream::flush() {
    m_file->flush();
}

void CDiskOutStream::setSize(int64_t size) {
    m_file->setSize(size);
}

CDiskIOStream::CDiskIOStream(const P<IURI>& uri, EOpenMode mode)
    : TDiskStream(CDiskFile::open(uri, EAccess::readWrite, mode)) {}

CDiskIOStream::~CDiskIOStream() = default;

void CDiskIOStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CDiskIOStream::readSome(void* buffer, int64_t size) {
    return m_file->readSome(buffer, size);
}

void CDiskIOStream::skip(int64_t size) {
    m_file->skip(size);
}

void CDiskIOStream::write(const void* buffer, int64_t size) {
    m_file->write(buffer, size);
}

void CDiskIOStream::flush() {
    m_file->flush();
}

void CDiskIOStream::setSize(int64_t size) {
    m_file->setSize(size);
}

P<IStreamMarker> CDiskIOStream::createMarker() {
    return make<CMarker>(P<ISeekableStream>::share(this));
}

} // namespace peru::posix
