#include "peru/Errors.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/system/ISystem.h"
#include "peru/system/ITimeManager.h"
#include "peru/threads/ISignal.h"
#include "peru/uri/URI.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <csignal>
#include <fcntl.h>
#include <functional>
#include <sys/resource.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

using namespace peru;
using tests::errorOf;
using namespace peru::literals;
using tests::toURI;

namespace {

constexpr uint32_t kLong = 60000; // only reached on a fault

P<IProcess> startShell(const std::string& script, std::vector<std::string> arguments = {}) {
    std::vector<P<IString>> all{"-c"_s, CString::fromUTF8(script), "sh"_s};
    for (const std::string& argument : arguments) all.push_back(CString::fromUTF8(argument));
    return getProcessManager()->start(toURI("/bin/sh"), all);
}

int runShell(const std::string& script, std::vector<std::string> arguments = {}) {
    int exitCode = -2;
    EXPECT_TRUE(startShell(script, std::move(arguments))->wait(kLong, exitCode));
    return exitCode;
}

TEST(Process, ExitCode_TellsHowItEnded) {
    EXPECT_EQ(runShell("exit 0"), 0);
    EXPECT_EQ(runShell("exit 255"), 255);
    EXPECT_EQ(runShell("kill -KILL $$"), 128 + SIGKILL);
}

TEST(Process, Arguments_ArriveByteForByte) {
    tests::CTempFolder folder;
    const std::string odd = "two words \"' $HOME \\ \xff\n*";
    EXPECT_EQ(
        runShell("printf '%s|%s|%s' \"$#\" \"$1\" \"$2\" > \"$3\"", {odd, "", (folder / "out").string()}), 0);
    EXPECT_EQ(tests::readFile(folder / "out"), "3|" + odd + "|");
}

TEST(Process, Child_InheritsTheStandardFilesOnly) {
    tests::CTempFolder folder;
    // Without the close-on-exec flag, as careless libraries open files.
    int open = ::open("/dev/null", O_RDONLY);
    ASSERT_GE(fcntl(open, F_DUPFD, 100), 100);
    EXPECT_EQ(runShell("ls /proc/$$/fd > \"$1\"", {(folder / "out").string()}), 0);
    EXPECT_NE(tests::readFile(folder / "out").find("\n2\n"), std::string::npos);
    EXPECT_EQ(tests::readFile(folder / "out").find("100"), std::string::npos);
    close(100);
    close(open);
}

TEST(Process, Child_StartsWithDefaultSignals) {
    sigset_t set, before;
    sigemptyset(&set);
    sigaddset(&set, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &set, &before);
    auto oldPipe = std::signal(SIGPIPE, SIG_IGN);
    EXPECT_EQ(runShell("kill -TERM $$; exit 1"), 128 + SIGTERM);
    EXPECT_EQ(runShell("kill -PIPE $$; exit 1"), 128 + SIGPIPE);
    std::signal(SIGPIPE, oldPipe);
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

TEST(Process, Wait_TimesOutAndTerminateEndsIt) {
    P<IProcess> process = getProcessManager()->start(toURI("/bin/sleep"), {"1000"_s}, 15);
    EXPECT_GE(getpriority(PRIO_PROCESS, static_cast<id_t>(process->getId())), 15);
    int exitCode = -2;
    EXPECT_FALSE(process->wait(0, exitCode));
    EXPECT_FALSE(process->wait(20, exitCode));
    EXPECT_EQ(exitCode, -2);
    process->terminate();
    EXPECT_TRUE(process->wait(kLong, exitCode));
    EXPECT_EQ(exitCode, 128 + SIGTERM);
    EXPECT_TRUE(process->wait(0, exitCode)) << "a second wait answers the same";
    EXPECT_EQ(exitCode, 128 + SIGTERM);
    process->terminate(); // the process no longer exists
}

TEST(Process, EndAction_RunsAtTheEndOrAtOnceAfterIt) {
    class CEndAction : public CObject, public IAction {
    public:
        void run() override { m_hasRun->set(); }
        const P<ISignal> m_hasRun = getSignalFactory()->createSignal();
    };
    const auto replaced = make<CEndAction>(), inTime = make<CEndAction>(), late = make<CEndAction>();
    P<IProcess> process = startShell("exec sleep 1000");
    process->setEndAction(replaced);
    process->setEndAction(inTime);
    process->kill();
    EXPECT_TRUE(inTime->m_hasRun->wait(kLong));
    process->setEndAction(late);
    EXPECT_TRUE(late->m_hasRun->wait(kLong));
    EXPECT_FALSE(replaced->m_hasRun->wait(0));
}

TEST(Process, EndedChildOfADroppedHandle_IsCollected) {
    pid_t id = static_cast<pid_t>(startShell("exit 0")->getId());
    // A zombie would remain for ever.
    for (int64_t end = getTimeManager()->getTime() + kLong; kill(id, 0) == 0;) {
        ASSERT_LT(getTimeManager()->getTime(), end);
        std::this_thread::yield();
    }
    EXPECT_EQ(errno, ESRCH);
}

TEST(Process, WhatCannotBeStarted_IsTold) {
    tests::CTempFolder folder;
    const std::string missing = (folder / "no such program").string();
    EXPECT_EQ(errorOf<CError>([&] { getProcessManager()->start(toURI(missing), {}); }),
              "Error starting '" + missing + "' (No such file or directory).");
    EXPECT_THROW(getProcessManager()->start(toURI(folder.write("text", "x")), {}), CError);
    EXPECT_THROW(getProcessManager()->start(make<CURI>("http://host/program"), {}), CError);
}

// The companion lives as long as the process that it is given.
TEST(Process, CancelAutoplay_EndsWithItsParent) {
    const P<IURI> folder = getSystem()->getSearchFolders(nullptr, nullptr)[0];
    const auto startCompanion = [&](const std::vector<std::string>& arguments) {
        std::vector<P<IString>> all;
        for (const std::string& argument : arguments) all.push_back(CString::fromUTF8(argument));
        return getProcessManager()->start(folder->appendPath("CancelAutoplay2"), all);
    };
    int exitCode = -2;
    for (const std::vector<std::string>& bad :
         {std::vector<std::string>{}, {"dummy"}, {"0"}, {"12x", "dummy"}}) {
        EXPECT_TRUE(startCompanion(bad)->wait(kLong, exitCode));
        EXPECT_EQ(exitCode, 2);
    }
    // After 300 ms it becomes another program.
    for (const uint32_t milliseconds : {50u, 450u}) {
        P<IProcess> parent = startShell("exec sleep 1000");
        P<IProcess> companion = startCompanion({std::to_string(parent->getId()), "dummy"});
        EXPECT_FALSE(companion->wait(milliseconds, exitCode));
        parent->terminate();
        EXPECT_TRUE(companion->wait(kLong, exitCode));
        EXPECT_EQ(exitCode, 0);
    }
}

TEST(DynamicLibrary, SymbolsAreFoundByNameAndByFile) {
    P<IDynamicLibrary> byName = getDynamicLibraryLoader()->loadByName("libm.so.6");
    auto* cosine = reinterpret_cast<double (*)(double)>(byName->findSymbol("cos"));
    ASSERT_TRUE(cosine);
    EXPECT_EQ(cosine(0), 1);
    EXPECT_EQ(byName->findSymbol("no_such_function"), nullptr);
}

TEST(DynamicLibrary, FailureTellsFileAndReason) {
    tests::CTempFolder folder;
    std::filesystem::path text = folder.write("text \xc3\xa4.so", "not a library");
    ASSERT_EQ(mkfifo((folder / "pipe").c_str(), 0600), 0);
    const std::tuple<std::function<void()>, std::string, std::string> cases[] = {
        {[&] { getDynamicLibraryLoader()->load(toURI(text)); }, text.string(), "file too short"},
        {[&] { getDynamicLibraryLoader()->load(toURI(folder / "no.so")); }, (folder / "no.so").string(),
         "No such file"},
        {[&] { getDynamicLibraryLoader()->load(toURI(folder / "pipe")); }, (folder / "pipe").string(),
         "not a regular file"},
        {[] { getDynamicLibraryLoader()->loadByName("libno-such.so"); }, "libno-such.so", "No such file"},
        {[] { getDynamicLibraryLoader()->loadByName(""); }, "''", "no name"},
        // A relative file is looked up in the current folder, never in the loader's search path.
        {[] { getDynamicLibraryLoader()->load(toURI("libm.so.6")); }, "./libm.so.6", "No such file"},
    };
    for (const auto& [load, name, reason] : cases) {
        const std::string description = errorOf<CError>(load);
        EXPECT_NE(description.find(name), std::string::npos) << description;
        EXPECT_NE(description.find(reason), std::string::npos) << description;
    }
}

} // namespace
