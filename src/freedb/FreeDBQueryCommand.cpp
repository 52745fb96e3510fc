#include "freedb/FreeDBQueryCommand.h"

#include "peru/strings/StringFormat.h"

namespace freedb {

using peru::CString;
using peru::format;

namespace {

std::string composeQuery(const CFreeDBDiscInfo& disc) {
    std::string command = CString::toStdString(
        format("cddb+query+%08x+%u+", disc.getDiscId(), static_cast<uint32_t>(disc.getTracks().size())));
    for (const int32_t offset : disc.getOffsets()) command += std::to_string(offset) + "+";
    return command + std::to_string(disc.getTotalSeconds());
}

} // namespace

CFreeDBQueryCommand::CFreeDBQueryCommand(const SFreeDBSettings& settings, const CFreeDBDiscInfo& disc)
    : CFreeDBCommand(settings, composeQuery(disc),
                     CString::toStdString(format("query-%08x", disc.getDiscId()))) {}

CFreeDBQueryCommand::~CFreeDBQueryCommand() = default;

EFreeDBResult CFreeDBQueryCommand::evaluate(const std::string& reply, const CTextDecoder& decoder) {
    SFreeDBCandidates found = parseQueryReply(reply, decoder);
    m_candidates = std::move(found.discs);
    // An empty list is no match either.
    return m_candidates.empty() ? EFreeDBResult::none : found.result;
}

} // namespace freedb
