// Arbitrary bytes as a chunked body: the outcome must not depend on the pieces in which they arrive or leave,
// and what was encoded must be decoded.
#include "peru/Errors.h"
#include "peru/net/HTTPResponse.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>

using namespace peru;
using namespace peru::net;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

std::string decode(std::string_view bytes, size_t inputSize, size_t outputSize) {
    CHTTPChunkDecoder decoder(500);
    std::string out;
    std::string buffer(outputSize, '\0');
    try {
        while (!bytes.empty() && !decoder.isAtEnd()) {
            std::string_view piece = bytes.substr(0, inputSize);
            bytes.remove_prefix(piece.size());
            while (!piece.empty() && !decoder.isAtEnd()) {
                const size_t before = piece.size();
                const size_t count = decoder.decode(piece, buffer.data(), buffer.size());
                require(count <= buffer.size() && piece.size() < before);
                out.append(buffer, 0, count);
            }
        }
    } catch (const CError&) {
        return out + "!";
    }
    return out + (decoder.isAtEnd() ? "." : "?");
}

std::string encode(std::string_view bytes, size_t chunkSize) {
    std::string out;
    while (!bytes.empty()) {
        const std::string_view chunk = bytes.substr(0, chunkSize);
        char line[20];
        std::snprintf(line, sizeof line, "%zx\r\n", chunk.size());
        out += line + std::string(chunk) + "\r\n";
        bytes.remove_prefix(chunk.size());
    }
    return out + "0\r\n\r\n";
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view bytes(reinterpret_cast<const char*>(data), size);
    const std::string whole = decode(bytes, size + 1, size + 1);
    require(decode(bytes, 1, 7) == whole && decode(bytes, 5, 1) == whole);
    const std::string text(bytes);
    require(decode(encode(bytes, size % 40 + 1), 3, 11) == text + ".");
    return 0;
}
