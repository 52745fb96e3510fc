#include "freedb/FreeDBReadCommand.h"

#include "peru/strings/StringFormat.h"

namespace freedb {

using peru::CString;
using peru::format;

CFreeDBReadCommand::CFreeDBReadCommand(const SFreeDBSettings& settings, const CFreeDBDiscDesc& candidate)
    : CFreeDBReadCommand(settings, encode(CString::toStdString(candidate.getCategory())),
                         candidate.getDiscId()) {}

CFreeDBReadCommand::CFreeDBReadCommand(const SFreeDBSettings& settings, const std::string& category,
                                       uint32_t id)
    : CFreeDBCommand(settings, CString::toStdString(format("cddb+read+%s+%08x", category.c_str(), id)),
                     CString::toStdString(format("read-%08x", id))) {}

CFreeDBReadCommand::~CFreeDBReadCommand() = default;

EFreeDBResult CFreeDBReadCommand::evaluate(const std::string& reply, const CTextDecoder& decoder) {
    m_info = parseReadReply(reply, decoder);
    return EFreeDBResult::exact;
}

} // namespace freedb
