// Arbitrary bytes as the replies of a CDDB server: whatever is accepted is clean text.
#include "freedb/FreeDBReply.h"
#include "peru/Errors.h"
#include "peru/strings/UTF8.h"

#include <cstdint>
#include <cstdlib>
#include <string>

using namespace freedb;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

void checkText(const P<peru::IString>& text, bool mayHaveLines = false) {
    const std::string bytes = peru::CString::toStdString(text);
    for (size_t at = 0; at < bytes.size();) {
        const size_t size = peru::measureUTF8Character(std::string_view(bytes).substr(at));
        const bool isControl = static_cast<unsigned char>(bytes[at]) < 0x20;
        require(size > 0 && (!isControl || (mayHaveLines && (bytes[at] == '\n' || bytes[at] == '\t'))));
        at += size;
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view reply(reinterpret_cast<const char*>(data), size);
    for (const char* charset : {"", "KOI8-R", "SHIFT_JIS", "ISO-2022-JP"}) {
        const CTextDecoder decoder("", charset);
        try {
            const SFreeDBCandidates found = parseQueryReply(reply, decoder);
            require(found.result != EFreeDBResult::none || found.discs.empty());
            for (const auto& disc : found.discs) {
                checkText(disc->getCategory());
                checkText(disc->getTitle());
            }
        } catch (const peru::CError& error) {
            checkText(error.getDescription());
        }
        try {
            const P<CAudioCDInfo> info = parseReadReply(reply, decoder);
            require(info && info->tracks.size() <= 99);
            for (const auto& text : {info->artist, info->title, info->year, info->genre}) checkText(text);
            checkText(info->extended, true);
            for (const auto& track : info->tracks) {
                checkText(track->artist);
                checkText(track->title);
                checkText(track->extended, true);
            }
        } catch (const peru::CError& error) {
            checkText(error.getDescription());
        }
    }
    return 0;
}
