// After a failed store the disk holds the complete old or the complete new file and nothing else, in every
// format.
#include "FaultyCalls.h"
#include "Support.h"

#include <gmock/gmock.h>

#include <csignal>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace peru;

namespace {

class StoreFaults : public testing::TestWithParam<const char*> {
protected:
    static constexpr const char* kName = "a file";

    void SetUp() override {
        m_old = tests::readFile(tests::makeSound(m_making, GetParam()));
        ASSERT_FALSE(m_old.empty());
        reset();
        ASSERT_EQ(prepare()(), "stored");
        m_new = tests::readFile(getFile());
        ASSERT_NE(m_new, m_old);
        reset();
    }

    std::filesystem::path getFile() const { return m_folder / (std::string(kName) + "." + GetParam()); }
    void reset() const { m_folder.write(getFile().filename(), m_old); }

    // Changes the title and adds a text that makes the tag larger. The returned operation stores the tag and
    // reports "stored" or the error text.
    std::function<std::string()> prepare() const {
        const P<filetag::IFileTag> tag = tests::open(getFile());
        tag->setTitle("Another title");
        tag->setComment(CString::fromUTF8(std::string(9000, 'c')));
        return [tag] { return report([&tag] { tag->store(); }); };
    }

    template <class Operation> static std::string report(Operation operation) {
        try {
            operation();
            return "stored";
        } catch (const CFileError& error) {
            return tests::text(error.getDescription());
        } catch (const CException& error) {
            return "not an error of a file: " + tests::text(error.getDescription());
        } catch (const std::exception& error) {
            return std::string("not an error of the system: ") + error.what();
        }
    }

    void expectOldOrNew(const tests::SFaultyRun& run) const {
        std::vector<std::string> others;
        for (const auto& entry : std::filesystem::directory_iterator(m_folder.path()))
            if (entry.path() != getFile()) others.push_back(entry.path());
        const std::string found = tests::readFile(getFile());
        if (run.report.empty()) { // killed
            EXPECT_TRUE(found == m_old || found == m_new);
            // Only a rename needs a second name. If the process is killed there, the file with that name must
            // be complete.
            if (run.renaming && others.size() == 1) {
                EXPECT_TRUE(tests::readFile(others[0]) == m_new);
                std::filesystem::remove(others[0]);
                others.clear();
            }
        } else if (run.report == "stored") {
            EXPECT_TRUE(found == m_new) << "stored, and not the new file";
        } else {
            EXPECT_TRUE(found == m_old) << run.report << (found == m_new ? ": new file" : ": neither file");
            EXPECT_THAT(run.report, testing::ContainsRegex("a( |%20)file")) << "does not name the file";
            EXPECT_THAT(run.report, testing::Not(testing::StartsWith("not an error")));
        }
        EXPECT_THAT(others, testing::IsEmpty());
    }

    tests::CTempFolder m_making;
    tests::CTempFolder m_folder;
    std::string m_old;
    std::string m_new;
};

} // namespace

TEST_P(StoreFaults, EveryFailingCallLeavesTheOldFileOrTheNewOne) {
    const struct {
        const char* name;
        int error;
        bool forGood;
    } kinds[] = {{"one call fails", EIO, false},
                 {"one call is not supported", EOPNOTSUPP, false},
                 {"the disk is full from here on", ENOSPC, true},
                 {"killed", 0, false}};
    for (const auto& kind : kinds)
        for (int call = 1;; ++call) {
            SCOPED_TRACE(std::string(kind.name) + ", call " + std::to_string(call));
            ASSERT_LT(call, 2000);
            reset();
            const tests::SFaultyRun run =
                tests::runWithFault({call, kind.error, kind.forGood}, [this] { return prepare(); });
            if (!run.supported) GTEST_SKIP() << "this kernel does not let a test fail another's calls";
            if (run.struck && kind.error == 0) {
                EXPECT_TRUE(WIFSIGNALED(run.status));
                EXPECT_EQ(run.report, "");
            } else {
                EXPECT_TRUE(WIFEXITED(run.status)) << "signal " << WTERMSIG(run.status);
                EXPECT_NE(run.report, "");
            }
            expectOldOrNew(run);
            if (HasFailure()) return;
            if (!run.struck) {
                EXPECT_EQ(run.report, "stored");
                break;
            }
        }
}

// A write in place that stops halfway is undone.
TEST_P(StoreFaults, HalfAWriteInPlaceIsUndone) {
    if (GetParam() == std::string("wav")) return; // always replaced
    m_folder.write(getFile().filename(), m_new);
    const auto change = [this] {
        const P<filetag::IFileTag> tag = tests::open(getFile());
        tag->setTitle("Changed title");
        return tag;
    };
    change()->store();
    const std::string changed = tests::readFile(getFile());
    ASSERT_EQ(changed.size(), m_new.size());
    size_t end = changed.size();
    while (changed[end - 1] == m_new[end - 1]) --end;
    m_folder.write(getFile().filename(), m_new);
    const tests::SFaultyRun run = tests::runWithFault({}, [&]() -> std::function<std::string()> {
        const P<filetag::IFileTag> tag = change();
        ::signal(SIGXFSZ, SIG_IGN);
        const rlimit limit{end - 2, end - 2};
        ::setrlimit(RLIMIT_FSIZE, &limit);
        return [tag] { return report([&tag] { tag->store(); }); };
    });
    if (!run.supported) GTEST_SKIP();
    EXPECT_NE(run.report, "stored");
    EXPECT_TRUE(tests::readFile(getFile()) == m_new) << run.report;
}

TEST_P(StoreFaults, ErrorsOfThePlaceNameTheFile) {
    const auto expectError = [this](const std::function<std::function<std::string()>()>& prepare) {
        const tests::SFaultyRun run = tests::runWithFault({}, prepare);
        if (!run.supported) return;
        EXPECT_NE(run.report, "");
        EXPECT_NE(run.report, "stored");
        std::filesystem::permissions(m_folder.path(), std::filesystem::perms(0700));
        std::filesystem::permissions(getFile(), std::filesystem::perms(0600));
        expectOldOrNew(run);
    };
    // Stores as a user for whom file permissions apply.
    const auto prepareAsUser = [this] {
        const std::function<std::string()> store = prepare();
        if (::getuid() == 0 && ::setuid(65534) != 0) ::_exit(1);
        return store;
    };
    const auto setModes = [this](int folder, int file) {
        std::filesystem::permissions(getFile(), std::filesystem::perms(file));
        std::filesystem::permissions(m_folder.path(), std::filesystem::perms(folder));
    };
    expectError([this] {
        const std::function<std::string()> store = prepare();
        ::signal(SIGXFSZ, SIG_IGN);
        const rlimit limit{m_old.size() / 2, m_old.size() / 2};
        ::setrlimit(RLIMIT_FSIZE, &limit);
        return store;
    });
    setModes(0555, 0666);
    expectError(prepareAsUser);
    setModes(0777, 0444);
    expectError(prepareAsUser);
    setModes(0777, 0000);
    expectError([this]() -> std::function<std::string()> {
        if (::getuid() == 0 && ::setuid(65534) != 0) ::_exit(1);
        return [this] { return report([this] { tests::open(getFile()); }); };
    });
}

INSTANTIATE_TEST_SUITE_P(Formats, StoreFaults, testing::Values("wav", "mp3", "flac", "ogg", "wma"),
                         [](const auto& instance) { return std::string(instance.param); });
