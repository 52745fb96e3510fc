#include "freedb/FreeDBReply.h"

#include "freedb/FreeDBRecord.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <algorithm>
#include <charconv>
#include <optional>

namespace freedb {

using peru::CError;
using peru::CString;
using peru::localize;

namespace {

constexpr int kOK = 200, kNoMatch = 202, kExactMatches = 210, kInexactMatches = 211;

CError makeInvalidReplyError() {
    return CError(
        localize("freedb.CFreeDBCommand.ServerInvalidReply", "The server returned an invalid reply."));
}

// The next line without its end.
std::string_view takeLine(std::string_view& text) {
    const size_t end = text.find('\n');
    std::string_view line = text.substr(0, end);
    text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    if (line.ends_with('\r')) line.remove_suffix(1);
    return line;
}

struct SReply {
    int code;
    std::string_view text; // the first line after the code
    std::string_view body;
};

SReply parseHead(std::string_view reply) {
    if (reply.empty())
        throw CError(localize("freedb.CFreeDBCommand.ErrorReply", "The server returned an empty message"));
    const std::string_view line = takeLine(reply);
    if (line.size() < 3 || (line.size() > 3 && line[3] != ' ')) throw makeInvalidReplyError();
    const std::string_view digits = line.substr(0, 3);
    if (digits.find_first_not_of("0123456789") != std::string_view::npos)
        throw CError(localize("freedb.CFreeDBCommand.ParseIntError",
                              "The resultcode could not be parsed: (Messgae %TEXT%).",
                              {{"%TEXT%", CString::fromUTF8(CTextDecoder({}, {}).decode(digits))}}));
    SReply parsed{0, line.substr(std::min<size_t>(line.size(), 4)), reply};
    std::from_chars(digits.data(), digits.data() + digits.size(), parsed.code);
    return parsed;
}

CError makeCodeError(int code) {
    if (code >= 200 && code <= 299) return makeInvalidReplyError();
    return CError(localize("freedb.CFreeDBCommand.ServerErrorReply",
                           "The server returned an error message (code %CODE%).",
                           {{"%CODE%", std::to_string(code).c_str()}}));
}

// "category discid title"; throws if the line does not fit.
P<CFreeDBDiscDesc> parseCandidate(std::string_view line, const CTextDecoder& decoder) {
    const size_t first = line.find(' ');
    const size_t second = first == std::string_view::npos ? first : line.find(' ', first + 1);
    if (first == 0 || second == std::string_view::npos) throw makeInvalidReplyError();
    const std::string_view digits = line.substr(first + 1, second - first - 1);
    uint32_t id = 0;
    const auto [stop, error] = std::from_chars(digits.data(), digits.data() + digits.size(), id, 16);
    if (digits.empty() || error != std::errc() || stop != digits.data() + digits.size())
        throw makeInvalidReplyError();
    return peru::make<CFreeDBDiscDesc>(CString::fromUTF8(decoder.decode(line.substr(0, first))), id,
                                       CString::fromUTF8(decoder.decode(line.substr(second + 1))));
}

} // namespace

SFreeDBCandidates parseQueryReply(std::string_view text, const CTextDecoder& decoder) {
    SReply reply = parseHead(text);
    SFreeDBCandidates found;
    switch (reply.code) {
    case kNoMatch:
        return found;
    case kOK:
        found.result = EFreeDBResult::exact;
        found.discs.push_back(parseCandidate(reply.text, decoder));
        return found;
    case kExactMatches:
    case kInexactMatches:
        found.result = reply.code == kExactMatches ? EFreeDBResult::exact : EFreeDBResult::inexact;
        while (!reply.body.empty()) {
            const std::string_view line = takeLine(reply.body);
            if (line == ".") break;
            found.discs.push_back(parseCandidate(line, decoder));
        }
        return found;
    default:
        throw makeCodeError(reply.code);
    }
}

P<CAudioCDInfo> parseReadReply(std::string_view text, const CTextDecoder& decoder) {
    SReply reply = parseHead(text);
    if (reply.code != kExactMatches) throw makeCodeError(reply.code);
    CFreeDBRecord record;
    while (!reply.body.empty()) {
        const std::string_view line = takeLine(reply.body);
        if (line == ".") break;
        record.addLine(line);
    }
    P<CAudioCDInfo> info = record.build(decoder);
    if (!info) throw makeInvalidReplyError();
    return info;
}

} // namespace freedb
