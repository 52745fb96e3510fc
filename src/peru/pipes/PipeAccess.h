// Who may connect to a pipe server.
#pragma once

#include "peru/strings/String.h"

#include <array>
#include <cstdint>
#include <vector>

namespace peru {

// "all" stands for every right and makes the other bits irrelevant.
enum EPipeRight : uint32_t { kPipeRead = 1, kPipeWrite = 2, kPipeExecute = 4, kPipeAll = 8 };

enum EPipeTrustee : int32_t {
    kPipeAdministrators = 0,
    kPipeAuthenticatedUsers = 1,
    kPipeAnonymous = 2,
    kPipeGuests = 3,
};

struct SPipeAccessRule {
    bool allow = true;
    uint32_t rights = 0; // bits of EPipeRight
    EPipeTrustee trustee = kPipeAuthenticatedUsers;
};

using CPipeAccessRules = std::array<SPipeAccessRule, 2>;

// The rules in the descriptor definition language, such as "D:(A;OICI;GRGW;;;AU)(D;OICI;GA;;;AN)". Throws
// CException with the title "Could not create DACL for Pipe Server" for a rule without rights, with other
// bits or with an unknown trustee.
PERU_API P<IString> formatPipeAccess(const CPipeAccessRules& rules);

// What a descriptor text grants. The first rule that concerns a right decides on it, and a right that no rule
// concerns is not granted.
class PERU_API CPipeAccessList {
public:
    // Throws CException with the title "Could not create DACL for Pipe Server" for any text that
    // formatPipeAccess does not produce, apart from the number of rules.
    explicit CPipeAccessList(const CStringArg& descriptor);

    // Whether a peer to which all of the given trustees apply (bits 1 << EPipeTrustee) has all of the rights.
    bool allows(uint32_t trustees, uint32_t rights) const;

private:
    std::vector<SPipeAccessRule> m_rules;
};

} // namespace peru
