// Arbitrary bytes as typed values, as a text file and as base64: every reader must end with a value or a
// family error.
#include "peru/Errors.h"
#include "peru/streams/Base64Streams.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/streams/TextFile.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>

using namespace peru;

namespace {

P<CMemoryIOStream> makeStream(const uint8_t* data, size_t size) {
    const P<CMemoryBlock> block = make<CMemoryBlock>(static_cast<int64_t>(size));
    if (size > 0) std::memcpy(block->getData(), data, size);
    return make<CMemoryIOStream>(block);
}

// A byte of the input selects the type of each value.
void readValues(const P<CDataInStream>& stream) {
    while (!stream->isAtEnd()) switch (stream->readUInt8() % 8) {
        case 0:
            stream->readInt16();
            break;
        case 1:
            stream->readInt32();
            break;
        case 2:
            stream->readInt64();
            break;
        case 3:
            stream->readDouble();
            break;
        case 4:
            stream->readString();
            break;
        case 5:
            stream->readURI();
            break;
        case 6:
            stream->readObject(make<CMemoryBlock>());
            break;
        case 7:
            stream->skip(stream->readUInt16());
            break;
        }
}

void readLines(const P<CMemoryIOStream>& stream) {
    const P<CTextFileReader> reader = make<CTextFileReader>(stream);
    while (reader->hasMoreLines()) reader->readLine();
}

void readBase64(const P<CMemoryIOStream>& stream) {
    const std::string bytes = readAll(*make<CBase64InStream>(stream));
    const P<CMemoryIOStream> memory = make<CMemoryIOStream>();
    const P<CBase64OutStream> encoder = make<CBase64OutStream>(memory);
    encoder->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    encoder->finish();
    if (memory->getSize() != stream->getSize()) std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto attempt = [&](auto&& read) {
        try {
            read(makeStream(data, size));
        } catch (const CException&) {
        }
    };
    attempt([](const P<CMemoryIOStream>& stream) { readValues(make<CDataInStream>(stream)); });
    attempt(readLines);
    attempt(readBase64);
    return 0;
}
