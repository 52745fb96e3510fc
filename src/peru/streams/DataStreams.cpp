#include "peru/streams/DataStreams.h"

#include "peru/Errors.h"
#include "peru/uri/URI.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <new>

namespace peru::detail {

namespace {

// Follows every object, so that a reader with another idea of its layout notices.
constexpr int32_t kCheckWord = 0x0001E240;

struct SFree {
    void operator()(char* bytes) const { std::free(bytes); }
};
using CTextBuffer = std::unique_ptr<char, SFree>;

void enlarge(CTextBuffer& buffer, int64_t capacity) {
    char* bytes = static_cast<char*>(std::realloc(buffer.get(), static_cast<size_t>(capacity)));
    if (!bytes) throw std::bad_alloc();
    (void)buffer.release();
    buffer.reset(bytes);
}

} // namespace

void writeString(IDataOutStream& stream, const P<IString>& value) {
    if (!value) {
        stream.writeInt32(0);
        return;
    }
    const P<IString> text = value->isEncoding(ICharEncoding::kUTF8) ? value : value->toUTF8String();
    stream.writeInt32(text->getDataSize());
    if (text->getDataSize() > 0) stream.write(text->getData(), text->getDataSize());
}

void writeObject(IDataOutStream& stream, const P<ISerializable>& object) {
    stream.writeBool(!object);
    if (!object) return;
    object->writeTo(P<IDataOutStream>::share(&stream));
    stream.writeInt32(kCheckWord);
}

void writeURI(IDataOutStream& stream, const P<IURI>& uri) {
    stream.writeBool(!uri);
    if (uri) writeString(stream, uri->getAsString());
}

P<IString> readString(IInStream& stream, int32_t most) {
    int32_t size = 0;
    int64_t known = 0;
    while (known < 4) {
        const int64_t count = stream.readSome(reinterpret_cast<uint8_t*>(&size) + known, 4 - known);
        if (count <= 0) return CString::empty();
        known += count;
    }
    if (size == 0) return CString::empty();
    if (size < 0) throw CEndOfStreamError(stream.getURI());
    if (size > most) return nullptr;

    // The size is a claim: memory is taken only as the bytes arrive.
    constexpr int64_t kFirstStep = 64 * 1024;
    CTextBuffer buffer;
    for (int64_t done = 0; done < size;) {
        const int64_t step = std::min<int64_t>(size - done, std::max(done, kFirstStep));
        enlarge(buffer, done + step + 1);
        stream.read(buffer.get() + done, step);
        done += step;
    }
    return CString::fromUTF8({reinterpret_cast<const char*>(buffer.get()), static_cast<size_t>(size)});
}

P<ISerializable> readObject(IDataInStream& stream, const P<ISerializable>& object) {
    if (stream.readBool()) return nullptr;
    if (!object) throw CInvalidArgError("object", "IDataInStream::readObject");
    object->readFrom(P<IDataInStream>::share(&stream));
    if (stream.readInt32() != kCheckWord)
        throw CException(newString("Error in object serialization.. write/read differ?"), nullptr);
    return object;
}

P<IURI> readURI(IDataInStream& stream) {
    if (stream.readBool()) return nullptr;
    return make<CURI>(stream.readString());
}

} // namespace peru::detail
