// Asks for the records that fit a disc.
#pragma once

#include "freedb/FreeDBCommand.h"
#include "freedb/FreeDBDiscInfo.h"

namespace freedb {

class FREEDB_API CFreeDBQueryCommand : public CFreeDBCommand {
public:
    CFreeDBQueryCommand(const SFreeDBSettings& settings, const CFreeDBDiscInfo& disc);
    ~CFreeDBQueryCommand() override;

    // In the order of the server.
    const std::vector<P<CFreeDBDiscDesc>>& getCandidates() const { return m_candidates; }

private:
    EFreeDBResult evaluate(const std::string& reply, const CTextDecoder& decoder) override;

    std::vector<P<CFreeDBDiscDesc>> m_candidates;
};

} // namespace freedb
