#include "peru/system/ISystem.h"

#include "peru/files/SystemCalls.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include "peru/system/ITimeManager.h"
#include "peru/uri/URI.h"

#include <chrono>
#include <csignal>
#include <dlfcn.h>
#include <fcntl.h>
#include <pwd.h>
#include <set>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

using namespace peru;
using tests::CEnvironment;
using tests::countEntries;
using tests::CTempFolder;
using tests::errorOf;
using tests::text;
using tests::toPath;
using tests::toURI;
namespace fs = std::filesystem;

TEST(System, FindsTheUsersFoldersByTheirRules) {
    CEnvironment home("HOME", "/home/user");
    using SCase = std::tuple<const char*, P<IURI> (ISystem::*)(), const char*>;
    for (const auto& [variable, getter, fallback] :
         {SCase{"XDG_DATA_HOME", &ISystem::getDataFolder, "/home/user/.local/share/"},
          SCase{"XDG_CONFIG_HOME", &ISystem::getConfigurationFolder, "/home/user/.config/"},
          SCase{"TMPDIR", &ISystem::getTemporaryFolder, "/tmp/"}}) {
        auto get = [method = getter] { return toPath((getSystem().get()->*method)()); };
        CEnvironment set(variable, "/some/where");
        EXPECT_EQ(get(), "/some/where/");
        for (const char* value : {static_cast<const char*>(nullptr), "", "not/absolute"}) {
            CEnvironment unusable(variable, value);
            EXPECT_EQ(get(), fallback);
        }
    }
    const CEnvironment data("XDG_DATA_HOME", nullptr), homeless("HOME", "relative");
    const passwd* user = ::getpwuid(::getuid());
    EXPECT_EQ(toPath(getSystem()->getDataFolder()),
              (fs::path(user ? user->pw_dir : "/") / ".local/share/").string());
}

TEST(System, SearchesTheListThenTheLibraryThenTheInstallation) {
    CEnvironment list("TW_TEST_PATH", "/one::relative:/two/:/one/");
    Dl_info library;
    ASSERT_NE(dladdr(reinterpret_cast<void*>(&peru::getSystem), &library), 0);
    std::string folder = fs::canonical(library.dli_fname).parent_path().string();
    std::vector<std::string> found;
    for (const P<IURI>& uri : getSystem()->getSearchFolders("TW_TEST_PATH", "share/tonewright"))
        found.push_back(toPath(uri));
    ASSERT_EQ(found.size(), 4u);
    EXPECT_EQ(found[0], "/one/");
    EXPECT_EQ(found[1], "/two/");
    EXPECT_EQ(found[2], folder + "/");
    EXPECT_EQ(found[3], fs::path(folder).parent_path().string() + "/share/tonewright/");
    EXPECT_EQ(getSystem()->getSearchFolders("TW_TEST_NOT_SET", nullptr).size(), 1u);
}

TEST(System, MakesNamesThatNobodyElseHas) {
    CTempFolder folder;
    std::set<std::string> names;
    for (int i = 0; i < 50; ++i) {
        names.insert(
            toPath(getSystem()->createUniqueFile(toURI(folder.path()), "a b", i % 2 ? ".wav" : "wav")));
        names.insert(toPath(getSystem()->createUniqueFolder(toURI(folder.path()), "d")));
    }
    EXPECT_EQ(names.size(), 100u);
    EXPECT_EQ(countEntries(folder.path()), 100u);
    for (const std::string& name : names) {
        struct stat status;
        ASSERT_EQ(stat(name.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 0777, name.ends_with('/') ? 0700u : 0600u);
        EXPECT_TRUE(name.ends_with('/') || name.ends_with(".wav"));
        EXPECT_FALSE(name.ends_with("..wav"));
    }
    P<IURI> missing = toURI(folder / "missing");
    EXPECT_EQ(errorOf([&] { getSystem()->createUniqueFile(missing, "a", ""); }),
              "Error creating unique file name.");
    EXPECT_EQ(errorOf([&] { getSystem()->createUniqueFolder(missing, "a"); }),
              "Error creating unique folder name.");
    EXPECT_THROW(getSystem()->createUniqueFile(toURI(folder.path()), "../a", ""), CFileError);
    EXPECT_EQ(countEntries(folder.path()), 100u);
}

TEST(System, NeverReplacesAndLeavesNoHalfCopy) {
    CTempFolder folder;
    P<IURI> source = toURI(folder.write("a", "new"));
    P<IURI> taken = toURI(folder.write("b", "old"));
    P<IURI> missing = toURI(folder / "missing");
    std::string names = "'" + toPath(source) + "' to '" + toPath(taken) + "'";
    EXPECT_EQ(errorOf([&] { getSystem()->copyFile(source, taken); }),
              "Error copying file " + names + ". The file already exists.");
    EXPECT_EQ(errorOf([&] { getSystem()->moveFile(source, taken); }), "Error moving file " + names + ".");
    EXPECT_EQ(errorOf([&] { getSystem()->moveFolder(source, taken); }), "Error moving folder " + names + ".");
    EXPECT_EQ(errorOf([&] { getSystem()->copyFile(missing, toURI(folder / "c")); }),
              "Error copying file '" + toPath(missing) + "' to '" + (folder / "c").string() +
                  "' (No such file or directory).");
    // Fails on the first read, after the destination was created.
    EXPECT_THROW(getSystem()->copyFile(toURI("/proc/self/mem"), toURI(folder / "c")), CFileError);
    fs::create_symlink(folder / "nowhere", folder / "link");
    EXPECT_THROW(getSystem()->copyFile(source, toURI(folder / "link")), CFileError);
    EXPECT_THROW(getSystem()->copyFile(toURI(folder.path()), toURI(folder / "c")), CFileError);
    ASSERT_EQ(mkfifo((folder / "pipe").c_str(), 0600), 0);
    EXPECT_THROW(getSystem()->copyFile(toURI(folder / "pipe"), toURI(folder / "c")), CFileError);
    EXPECT_THROW(getSystem()->copyFile(make<CURI>("http://host/a"), toURI(folder / "c")),
                 CURITypeNotSupportedError);
    EXPECT_EQ(tests::readFile(folder / "b"), "old");
    EXPECT_EQ(countEntries(folder.path()), 4u);
    // A file whose size the kernel does not report.
    getSystem()->copyFile(toURI("/proc/self/status"), toURI(folder / "c"));
    EXPECT_NE(tests::readFile(folder / "c").find("VmRSS"), std::string::npos);
}

TEST(System, CopiesAndMovesWhateverTheSystemCallsDo) {
    const CTempFolder folder;
    const std::string bytes = tests::readFile("/proc/self/exe").substr(0, 1'000'001);
    const P<IURI> source = toURI(folder.write("a", bytes)), copy = toURI(folder / "b");
    tests::failEach(
        {{"", 0, true},
         {"read", EIO, false},
         {"write", ENOSPC, false},
         {"fchmod", EPERM, true},
         {"fchmod", ENOTSUP, true},
         {"fchmod", EIO, false},
         {"futimens", EIO, false}},
        [&] { getSystem()->copyFile(source, copy); },
        [&](bool done) {
            EXPECT_TRUE(!done || tests::readFile(folder / "b") == bytes);
            EXPECT_EQ(fs::remove(folder / "b"), done);
        });
    // A file system that cannot rename without replacing.
    folder.write("b", "old");
    for (const int error : {EINVAL, ENOSYS}) {
        const tests::CSystemCalls calls([&](auto& call, int) { return call == "renameat2" ? error : 0; });
        EXPECT_THROW(getSystem()->moveFile(source, copy), CFileError);
        EXPECT_EQ(tests::readFile(folder / "b"), "old");
        getSystem()->moveFile(copy, toURI(folder / "c"));
        getSystem()->moveFile(toURI(folder / "c"), copy);
    }
}

TEST(System, KeepsTheOldFileWhereTheNewOneDoesNotFit) {
    CTempFolder folder;
    const fs::path old = folder.write("old", "precious");
    const std::string large(1 << 20, 'x');
    const auto size = static_cast<int64_t>(large.size());
    struct rlimit limit;
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &limit), 0);
    const struct rlimit small { 4096, limit.rlim_max };
    const auto before = std::signal(SIGXFSZ, SIG_IGN);
    ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
    const std::string error = errorOf([&] { getSystem()->replaceFile(toURI(old), large.data(), size); });
    setrlimit(RLIMIT_FSIZE, &limit);
    std::signal(SIGXFSZ, before);
    EXPECT_NE(error.find("old' could not be written: File too large"), std::string::npos) << error;
    EXPECT_EQ(tests::readFile(old), "precious");
    EXPECT_THROW(getSystem()->replaceFile(toURI(folder / "nowhere" / "x"), "x", 1), CFileError);
    EXPECT_EQ(countEntries(folder.path()), 1u);
}

TEST(System, TellsTheVersionOfALibrary) {
    std::string version = text(getSystem()->getLibraryVersion("libgio-2.0.so.0"));
    EXPECT_TRUE(version.starts_with("0.")) << version;
    EXPECT_EQ(text(getSystem()->getLibraryVersion("libc.so.6")), "6");
    // A copy has the version in its inner name only.
    const CTempFolder folder;
    Dl_info math;
    ASSERT_NE(dladdr(dlsym(RTLD_DEFAULT, "cos"), &math), 0);
    fs::copy_file(fs::canonical(math.dli_fname), folder / "copy.so");
    EXPECT_EQ(text(getSystem()->getLibraryVersion(CString::fromUTF8((folder / "copy.so").string()))), "6");
    for (const char* none : {"", "libnone.so.1", "linux-vdso.so.1"})
        EXPECT_EQ(text(getSystem()->getLibraryVersion(none)), "");
}

TEST(System, TimeAgreesWithTheStandardLibrary) {
    const auto now = [] {
        return std::chrono::system_clock::now().time_since_epoch() / std::chrono::milliseconds(1);
    };
    const int64_t before = now(), time = getTimeManager()->getTime();
    EXPECT_TRUE(before <= time && time <= now()) << time;
}
