#include "peru/pipes/PipeAccess.h"
#include "peru/pipes/PipeName.h"
#include "peru/pipes/PipeSupport.h"

namespace {

using namespace peru;
using tests::text;
using tests::titleOf;

constexpr char kNoDacl[] = "Could not create DACL for Pipe Server";

TEST(PipeAccess, RulesHaveTheirTextForm) {
    const struct {
        CPipeAccessRules rules;
        const char* text;
    } cases[] = {
        {{{{true, kPipeRead | kPipeWrite, kPipeAuthenticatedUsers}, {false, kPipeAll, kPipeAnonymous}}},
         "D:(A;OICI;GRGW;;;AU)(D;OICI;GA;;;AN)"},
        {{{{true, kPipeAll | kPipeRead, kPipeAdministrators}, {true, kPipeExecute, kPipeGuests}}},
         "D:(A;OICI;GA;;;BA)(A;OICI;GX;;;BG)"},
        {{{{false, 7, kPipeGuests}, {true, kPipeWrite, kPipeAdministrators}}},
         "D:(D;OICI;GRGWGX;;;BG)(A;OICI;GW;;;BA)"},
    };
    for (const auto& each : cases) EXPECT_EQ(text(formatPipeAccess(each.rules)), each.text);

    for (const SPipeAccessRule& bad :
         {SPipeAccessRule{true, 0, kPipeGuests}, SPipeAccessRule{true, 16, kPipeGuests},
          SPipeAccessRule{true, kPipeRead, static_cast<EPipeTrustee>(4)}})
        EXPECT_EQ(titleOf([&] { formatPipeAccess({{{true, kPipeAll, kPipeGuests}, bad}}); }), kNoDacl);
    for (const char* bad : {"", "O:BA", "D:(A;OICI;GR;;;AU", "D:(X;OICI;GR;;;AU)", "D:(A;OICI;;;;AU)",
                            "D:(A;OICI;GWGR;;;AU)", "D:(A;OICI;GR;;;XX)", "D:(A;OICI;GR;;;AU) "})
        EXPECT_EQ(titleOf([&] { CPipeAccessList list(bad); }), kNoDacl) << bad;
}

// Judged by a second evaluation that looks at one right at a time.
TEST(PipeAccess, FirstRuleThatConcernsARightDecides) {
    for (uint32_t bits = 0; bits < 1u << 14; ++bits) {
        CPipeAccessRules rules;
        for (size_t i = 0; i < 2; ++i) {
            const uint32_t rule = bits >> 7 * i;
            rules[i] = {(rule & 1) != 0, rule >> 1 & 15, static_cast<EPipeTrustee>(rule >> 5 & 3)};
        }
        if (rules[0].rights == 0 || rules[1].rights == 0) continue;
        const CPipeAccessList list(formatPipeAccess(rules));
        for (const uint32_t trustees : {1u, 3u, 2u, 12u}) {
            bool expected = true;
            for (const uint32_t right : {kPipeRead, kPipeWrite}) {
                bool granted = false;
                for (const SPipeAccessRule& rule : rules)
                    if ((trustees >> rule.trustee & 1) && (rule.rights & (right | kPipeAll))) {
                        granted = rule.allow;
                        break;
                    }
                expected = expected && granted;
            }
            ASSERT_EQ(list.allows(trustees, kPipeRead | kPipeWrite), expected)
                << text(formatPipeAccess(rules)) << " for " << trustees;
        }
    }
}

TEST(PipeName, CannotLeaveItsFolder) {
    for (const char* good : {"a", "sonora2_slave-0000abcd-00000001-00000002", "with blanks", "x.y"})
        EXPECT_TRUE(isPipeName(good)) << good;
    EXPECT_TRUE(isPipeName(std::string(80, 'x').c_str()));
    EXPECT_FALSE(isPipeName(std::string(81, 'x').c_str()));
    for (const char* bad : {"", ".", "..", ".hidden", "../x", "/x", "a/b", "a\\b", "a\nb", "\x7F"}) {
        EXPECT_FALSE(isPipeName(bad)) << bad;
        EXPECT_THROW(getPipeManager()->createServer(newString(bad)), CInvalidArgError);
        EXPECT_THROW(getPipeManager()->createClient(newString(bad)), CInvalidArgError);
    }
    EXPECT_EQ(text(getFullPipeName("slave-1")), "\\\\.\\pipe\\slave-1");
}

} // namespace
