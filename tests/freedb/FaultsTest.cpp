// Look-ups whose system calls fail.
#include "filetag/FaultyCalls.h"
#include "freedb/CddbServer.h"
#include "freedb/FreeDBInfoRetriever.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <sys/wait.h>

namespace {

using namespace freedb;
using peru::make;

// A whole look-up that stores its answers: the title, or the reason of the failure.
std::string lookUp(const SFreeDBSettings& settings) {
    try {
        const auto disc = CFreeDBDiscInfo::fromOffsets({182, 10000}, 20000);
        const P<CFreeDBInfoRetriever> retriever =
            make<CFreeDBInfoRetriever>(settings, std::vector<P<CFreeDBDiscInfo>>{disc}, nullptr);
        while (!retriever->advance(true)) {
        }
        return retriever->getInfo() ? "found " + tests::text(retriever->getInfo()->title)
                                    : tests::text(retriever->getErrorMessage());
    } catch (const std::exception& error) {
        return std::string("an exception: ") + error.what();
    }
}

} // namespace

// Each call in turn, with the look-up waiting: it ends, and either finds the record or states a reason.
TEST(CddbFaults, EveryCallMayFail) {
    const tests::CCddbServer server;
    SFreeDBSettings settings;
    settings.host = "127.0.0.1";
    settings.port = server.getPort();
    settings.clientName = "test";
    settings.clientVersion = "1";
    settings.proxy = "";
    settings.totalTimeout = 20'000;
    for (const auto& [error, forGood] : {std::pair(EINTR, false), {ENOBUFS, false}, {ENOBUFS, true}}) {
        size_t found = 0;
        for (int call = 1;; ++call) {
            const tests::CTempFolder folder;
            settings.cacheFolder = folder / "cache";
            const tests::SFaultyRun run =
                tests::runWithFault({call, error, forGood, tests::ECalls::network},
                                    [&] { return [&settings] { return lookUp(settings); }; });
            if (!run.supported) GTEST_SKIP() << "calls cannot be intercepted";
            EXPECT_TRUE(WIFEXITED(run.status) && WEXITSTATUS(run.status) == 0) << call << " " << run.status;
            EXPECT_FALSE(run.report.empty()) << call;
            EXPECT_THAT(run.report, testing::Not(testing::StartsWith("an exception"))) << call;
            const bool isFound = run.report == "found Café";
            found += isFound;
            if (HasFailure()) return;
            for (const auto& file : std::filesystem::recursive_directory_iterator(folder.path()))
                EXPECT_EQ(file.path().string().find(".tmp"), std::string::npos) << file.path();
            if (!run.struck) {
                EXPECT_GT(call, 15);
                EXPECT_TRUE(isFound) << run.report;
                break;
            }
        }
        EXPECT_GT(found, 0u);
    }
}
