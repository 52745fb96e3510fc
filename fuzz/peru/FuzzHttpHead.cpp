// Arbitrary bytes as the head of an HTTP response: the outcome must not depend on the pieces in which it
// arrives.
#include "peru/Errors.h"
#include "peru/net/HTTPRequest.h"
#include "peru/net/HTTPResponse.h"
#include "peru/uri/URI.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>

using namespace peru;
using namespace peru::net;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

// Everything that a client uses of the response, in one text.
std::string parse(std::string_view bytes, size_t pieceSize) {
    try {
        CHTTPResponse response(1000);
        while (!bytes.empty() && !response.isComplete()) {
            const std::string_view piece = bytes.substr(0, pieceSize);
            bytes.remove_prefix(piece.size());
            response.parse(piece);
        }
        if (!response.isComplete()) return "incomplete";
        std::string out =
            std::to_string(response.getStatus()) + CString::toStdString(response.getReason()) + "\n";
        for (const CHTTPHeaders::SHeader& header : response.getHeaders())
            out += header.name + ":" + header.value + "\n";
        if (const P<IURI> uri = response.getRedirection(make<CURI>("http://host:81/a/b?c#d"))) {
            require(CHTTPRequest::isSupported(uri));
            const SHTTPRequestHead head = composeRequestHead(*make<CHTTPRequest>("GET", uri), nullptr);
            // One request, whatever the target: no line end but those of the four or five lines.
            require(std::count(head.bytes.begin(), head.bytes.end(), '\n') <= 5);
            out += head.bytes;
        }
        out += std::to_string(static_cast<int>(response.getBodyMode("GET")));
        require(response.getContentLength() >= -1);
        return out + response.takeRest() + std::string(bytes);
    } catch (const CError&) {
        return "illegal";
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view bytes(reinterpret_cast<const char*>(data), size);
    const std::string whole = parse(bytes, size + 1);
    // too.
    for (const size_t pieceSize : {1, 3, 50}) require(parse(bytes, pieceSize) == whole);
    return 0;
}
