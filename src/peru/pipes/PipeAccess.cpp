#include "peru/pipes/PipeAccess.h"

#include "peru/Exception.h"

#include <string_view>

namespace peru {

namespace {

struct SRightName {
    uint32_t right;
    std::string_view name;
};
constexpr SRightName kRightNames[] = {{kPipeRead, "GR"}, {kPipeWrite, "GW"}, {kPipeExecute, "GX"}};
constexpr std::string_view kAllName = "GA";
constexpr uint32_t kEachRight = kPipeRead | kPipeWrite | kPipeExecute;
constexpr std::string_view kTrusteeNames[] = {"BA", "AU", "AN", "BG"};

[[noreturn]] void throwError() {
    throw CException(nullptr, newString("Could not create DACL for Pipe Server"));
}

// Reads a descriptor from its start.
class CParser {
public:
    explicit CParser(std::string_view text) : m_rest(text) {}

    bool isAtEnd() const { return m_rest.empty(); }
    bool take(std::string_view text) {
        if (!m_rest.starts_with(text)) return false;
        m_rest.remove_prefix(text.size());
        return true;
    }
    void require(std::string_view text) {
        if (!take(text)) throwError();
    }

private:
    std::string_view m_rest;
};

uint32_t parseRights(CParser& parser) {
    if (parser.take(kAllName)) return kPipeAll;
    uint32_t rights = 0;
    for (const SRightName& each : kRightNames)
        if (parser.take(each.name)) rights |= each.right;
    if (rights == 0) throwError();
    return rights;
}

EPipeTrustee parseTrustee(CParser& parser) {
    for (size_t i = 0; i < std::size(kTrusteeNames); ++i)
        if (parser.take(kTrusteeNames[i])) return static_cast<EPipeTrustee>(i);
    throwError();
}

} // namespace

P<IString> formatPipeAccess(const CPipeAccessRules& rules) {
    std::string text = "D:";
    for (const SPipeAccessRule& rule : rules) {
        const auto trustee = static_cast<size_t>(rule.trustee);
        if (rule.rights == 0 || (rule.rights & ~(kEachRight | kPipeAll)) != 0) throwError();
        if (trustee >= std::size(kTrusteeNames)) throwError();
        text += rule.allow ? "(A;OICI;" : "(D;OICI;";
        if (rule.rights & kPipeAll)
            text += kAllName;
        else
            for (const SRightName& each : kRightNames)
                if (rule.rights & each.right) text += each.name;
        text.append(";;;").append(kTrusteeNames[trustee]).append(")");
    }
    return CString::fromUTF8(text);
}

CPipeAccessList::CPipeAccessList(const CStringArg& descriptor) {
    const std::string text = CString::toStdString(descriptor);
    CParser parser(text);
    parser.require("D:");
    while (!parser.isAtEnd()) {
        SPipeAccessRule rule;
        parser.require("(");
        rule.allow = parser.take("A;");
        if (!rule.allow) parser.require("D;");
        parser.require("OICI;");
        rule.rights = parseRights(parser);
        parser.require(";;;");
        rule.trustee = parseTrustee(parser);
        parser.require(")");
        m_rules.push_back(rule);
    }
}

bool CPipeAccessList::allows(uint32_t trustees, uint32_t rights) const {
    uint32_t missing = rights & kPipeAll ? kEachRight : rights & kEachRight;
    for (const SPipeAccessRule& rule : m_rules) {
        if (!(trustees & 1u << rule.trustee)) continue;
        const uint32_t concerned = missing & (rule.rights & kPipeAll ? kEachRight : rule.rights);
        if (concerned != 0 && !rule.allow) return false;
        missing &= ~concerned;
    }
    return missing == 0;
}

} // namespace peru
