// Reads a record.
#pragma once

#include "freedb/FreeDBCommand.h"

namespace freedb {

class FREEDB_API CFreeDBReadCommand : public CFreeDBCommand {
public:
    CFreeDBReadCommand(const SFreeDBSettings& settings, const CFreeDBDiscDesc& candidate);
    ~CFreeDBReadCommand() override;

    // Empty unless the result is EFreeDBResult::exact.
    const P<CAudioCDInfo>& getInfo() const { return m_info; }

private:
    CFreeDBReadCommand(const SFreeDBSettings& settings, const std::string& category, uint32_t id);
    EFreeDBResult evaluate(const std::string& reply, const CTextDecoder& decoder) override;

    P<CAudioCDInfo> m_info;
};

} // namespace freedb
