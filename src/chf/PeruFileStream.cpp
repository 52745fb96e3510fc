#include "chf/PeruFileStream.h"

#include "peru/IInterfaceQuery.h"
#include "peru/streams/IStreamManager.h"

#include <limits>
#include <stdexcept>
#include <vector>

namespace chf {

using peru::P;

namespace {

template <class T> P<T> find(const P<peru::IStreamBase>& stream) {
    return peru::interfaceCast<T>(stream);
}

} // namespace

TRef<CPeruFileStream> CPeruFileStream::Open(const P<peru::IURI>& uri, EFileAccess access) {
    const P<peru::IStreamManager> manager = peru::getStreamManager();
    P<peru::IStreamBase> stream;
    if (access == EFileAccess::read)
        stream = manager->getSeekableInStream(uri);
    else
        stream = manager->getSeekableIOStream(uri, peru::EOpenMode::open);
    return TRef<CPeruFileStream>(new CPeruFileStream(stream));
}

CPeruFileStream::CPeruFileStream(const P<peru::IStreamBase>& stream) : m_stream(stream) {}
CPeruFileStream::~CPeruFileStream() = default;

int64_t CPeruFileStream::GetPosition() {
    const P<peru::IResetableStream> stream = find<peru::IResetableStream>(m_stream);
    if (!stream) throw std::runtime_error("the stream of the chunk file has no position");
    return stream->getPosition();
}

int64_t CPeruFileStream::GetSize() {
    const P<peru::ISeekableStream> stream = find<peru::ISeekableStream>(m_stream);
    if (!stream) throw std::runtime_error("the stream of the chunk file has no size");
    return stream->getSize();
}

void CPeruFileStream::Seek(int64_t position) {
    P<peru::ISeekableStream> stream = find<peru::ISeekableInStream>(m_stream);
    if (!stream) stream = find<peru::ISeekableIOStream>(m_stream);
    if (!stream) stream = find<peru::ISeekableOutStream>(m_stream);
    if (!stream) throw std::runtime_error("the stream of the chunk file is not seekable");
    stream->seek(position);
}

void CPeruFileStream::Write(const void* buffer, uint32_t count) {
    P<peru::IOutStream> stream = find<peru::IIOStream>(m_stream);
    if (!stream) stream = find<peru::IOutStream>(m_stream);
    if (!stream) throw std::runtime_error("the stream of the chunk file is read-only");
    stream->write(buffer, count);
}

uint32_t CPeruFileStream::Read(void* buffer, uint32_t count) {
    const P<peru::IInStream> stream = find<peru::IInStream>(m_stream);
    uint32_t done = 0;
    while (stream && done < count) {
        const int64_t read = stream->readSome(static_cast<char*>(buffer) + done, count - done);
        if (read <= 0) break;
        done += static_cast<uint32_t>(read);
    }
    return done;
}

void CPeruFileStream::RemoveSpace(int64_t count) {
    if (count > 0) Truncate(GetSize() - count);
}

void CPeruFileStream::Truncate(int64_t) {
    throw std::runtime_error("a chunk file cannot be truncated");
}

void CPeruFileStream::Grow(int64_t size) {
    const int64_t position = GetPosition();
    const int64_t end = GetSize();
    const int64_t added = size - end;
    if (added <= 0 || added > std::numeric_limits<int32_t>::max())
        throw std::runtime_error("a chunk file cannot grow by this size");
    const std::vector<char> zeros(static_cast<size_t>(added));
    Seek(end);
    Write(zeros.data(), static_cast<uint32_t>(added));
    if (GetSize() != size) Truncate(0);
    Seek(position);
}

} // namespace chf
