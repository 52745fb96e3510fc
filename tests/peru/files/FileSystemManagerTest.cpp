#include "peru/files/IFileSystemManager.h"

#include "peru/files/SystemCalls.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include "peru/files/ReadOnlyFileSystem.h"
#include "peru/files/posix/FileTimes.h"
#include "peru/uri/URI.h"

#include <fcntl.h>
#include <functional>
#include <map>
#include <sys/stat.h>
#include <unistd.h>

using namespace peru;
using tests::CTempFolder;
using tests::errorOf;
using tests::readFile;
using tests::text;
using tests::toPath;
using tests::toURI;
namespace fs = std::filesystem;

namespace {

P<IFileSystemManager> manager() {
    return getFileSystemManager();
}

// Every path below the folder with its type, times and content.
using CTree = std::map<std::string, std::string>;
CTree readTree(const fs::path& folder) {
    CTree tree;
    for (const fs::directory_entry& entry : fs::recursive_directory_iterator(folder)) {
        std::string& value = tree[entry.path().lexically_relative(folder).string()];
        struct stat status;
        if (lstat(entry.path().c_str(), &status) != 0) ADD_FAILURE();
        if (entry.is_symlink())
            value = "-> " + fs::read_symlink(entry.path()).string();
        else
            value = std::to_string(status.st_mode) + " " + std::to_string(status.st_mtim.tv_sec) + "." +
                    std::to_string(status.st_mtim.tv_nsec) + " " +
                    (entry.is_regular_file() ? readFile(entry.path()) : "");
    }
    return tree;
}

// Three levels of folders, names that are not UTF-8, links to a file, to nothing and upwards.
void makeTree(const fs::path& folder) {
    fs::create_directories(folder / "one/two/three");
    fs::create_directory(folder / "empty");
    std::ofstream(folder / "a.txt") << "alpha";
    std::ofstream(folder / "one/50% #?.wav") << "beta";
    std::ofstream(folder / "one/two/\xff\xe4 x\ny") << std::string(300000, 'z');
    std::ofstream(folder / "one/a:b") << "";
    fs::create_symlink("../a.txt", folder / "one/link");
    fs::create_symlink("/nowhere/at/all", folder / "one/two/dangling");
    fs::create_symlink("..", folder / "one/two/up");
    chmod((folder / "one/two").c_str(), 0711);
    chmod((folder / "a.txt").c_str(), 0400);
    const timespec times[2] = {{1000000000, 123456789}, {1200000000, 987654321}};
    for (const char* name : {"one/two", "one", "a.txt", "empty"})
        utimensat(AT_FDCWD, (folder / name).c_str(), times, 0);
}

// A folder on a different volume than the temporary folder; empty if this machine has none.
class COtherVolume {
public:
    explicit COtherVolume(const fs::path& here) {
        struct stat a, b;
        if (stat(here.c_str(), &a) != 0 || stat("/dev/shm", &b) != 0 || a.st_dev == b.st_dev) return;
        std::string name = "/dev/shm/tonewright-test-XXXXXX";
        if (mkdtemp(name.data())) path = name;
    }
    ~COtherVolume() {
        std::error_code ignored;
        if (!path.empty()) fs::remove_all(path, ignored);
    }
    fs::path path;
};

class FileSystemManager : public testing::Test {
protected:
    P<IURI> at(const std::string& name) const { return toURI(folder / name); }
    P<IURI> write(const std::string& name, const std::string& bytes) const {
        return toURI(folder.write(name, bytes));
    }
    std::string path(const std::string& name) const { return "'" + (folder / name).string() + "'"; }

    const CTempFolder folder;
};

} // namespace

TEST_F(FileSystemManager, TellsWhatIsThere) {
    const P<IURI> file = write(".hidden", "12345"), self = at("self"), missing = at("missing"),
                  foreign = make<CURI>("http://host/a");
    fs::create_symlink(folder / "none", folder / "dangling");
    fs::create_directory_symlink(folder.path(), folder / "self");
    const std::pair<P<IURI>, const char*> cases[] = {
        {file, "file"}, {at("dangling"), "other"}, {self, "folder"}, {missing, "none"}, {foreign, "none"}};
    for (const auto& [uri, kind] : cases) {
        EXPECT_EQ(manager()->exists(uri), kind != std::string("none")) << kind;
        EXPECT_EQ(manager()->isFile(uri), kind == std::string("file")) << kind;
        EXPECT_EQ(manager()->isFolder(uri), kind == std::string("folder")) << kind;
    }
    EXPECT_EQ(manager()->getFileSize(file), 5);
    EXPECT_TRUE(manager()->getAttributes(file).hidden);
    chmod((folder / ".hidden").c_str(), 0555);
    EXPECT_TRUE(manager()->getAttributes(file).readOnly && manager()->getAttributes(file).executable);
    EXPECT_TRUE(manager()->getAttributes(self).link);
    EXPECT_THROW(manager()->getFileSize(missing), CFileNotFoundError);
    EXPECT_THROW(manager()->getFileSize(foreign), CURITypeNotSupportedError);
}

TEST_F(FileSystemManager, EnumeratesEveryNameOnce) {
    makeTree(folder.path());
    std::map<std::string, std::string> found;
    P<IFileObjectCursor> cursor = manager()->enumerate(at("one"));
    for (int round = 0; round < 2; ++round) {
        found.clear();
        EXPECT_THROW(cursor->getFileObject(), CInvalidObjectStateError);
        while (cursor->next()) {
            P<IFileObject> child = cursor->getFileObject();
            EXPECT_TRUE(found.emplace(text(child->getName()), toPath(child->getURI())).second);
        }
        EXPECT_FALSE(cursor->next());
        cursor->reset();
    }
    const std::string base = (folder / "one").string();
    EXPECT_EQ(found, (std::map<std::string, std::string>{{"two", base + "/two/"},
                                                         {"50% #?.wav", base + "/50% #?.wav"},
                                                         {"a:b", base + "/a:b"},
                                                         {"link", base + "/link"}}));
    EXPECT_EQ(errorOf([&] { manager()->enumerate(at("a.txt")); }), path("a.txt") + " is not a folder.");
    EXPECT_THROW(manager()->enumerate(at("none")), CFileNotFoundError);
}

TEST_F(FileSystemManager, KeepsTimesToTheNanosecond) {
    P<IURI> file = write("a", "");
    manager()->setTimes(file, make<CFileTimes>(CFileTimes::kUnknown, -1500000001, 1234567890123456789));
    P<CFileTimes> times = manager()->getTimes(file);
    EXPECT_EQ(times->getLastAccessTime(), -1500000001);
    EXPECT_EQ(times->getLastWriteTime(), 1234567890123456789);
    manager()->setTimes(file, make<CFileTimes>(0, CFileTimes::kUnknown, 5));
    EXPECT_EQ(manager()->getTimes(file)->getLastAccessTime(), -1500000001);
    EXPECT_EQ(manager()->getTimes(file)->getLastWriteTime(), 5);
    EXPECT_THROW(manager()->setTimes(at("none"), times), CFileError);
    // Beyond what 64 bits hold.
    const timespec late{10'000'000'000, 0}, early{-10'000'000'000, 0};
    const posix::CFileTimes extreme(&early, early, late);
    EXPECT_EQ(extreme.getLastWriteTime(), INT64_MAX);
    EXPECT_EQ(extreme.getLastAccessTime(), INT64_MIN + 1);
}

TEST_F(FileSystemManager, CreatesParentsOrNothing) {
    manager()->createFolder(at("a/b/c/"));
    manager()->createFolder(at("a/b/c"));
    EXPECT_TRUE(fs::is_directory(folder / "a/b/c"));
    folder.write("a/file", "");
    EXPECT_EQ(errorOf([&] { manager()->createFolder(at("a/file")); }),
              "Error creating the folder " + path("a/file") + " (File exists).");
    std::string tooLong = (folder / "x/y").string() + "/" + std::string(300, 'n');
    EXPECT_EQ(errorOf([&] { manager()->createFolder(toURI(tooLong)); }),
              "Error creating the folder '" + tooLong + "' (File name too long).");
    EXPECT_FALSE(fs::exists(folder / "x"));
}

TEST_F(FileSystemManager, DeletesWithoutFollowingLinks) {
    fs::create_directory(folder / "keep");
    folder.write("keep/a", "1");
    makeTree(folder / "gone");
    fs::create_directory_symlink(folder / "keep", folder / "gone/link");
    fs::create_directory_symlink(folder / "keep", folder / "direct");
    EXPECT_EQ(errorOf([&] { manager()->deleteFolder(at("direct/")); }),
              "Error deleting the folder " + path("direct/") + " (Not a directory).");
    manager()->deleteFile(at("direct"));
    manager()->deleteFolder(at("gone"));
    EXPECT_EQ(readTree(folder.path()).size(), 2u);
    EXPECT_EQ(readFile(folder / "keep/a"), "1");

    EXPECT_EQ(errorOf([&] { manager()->deleteFile(at("none")); }),
              "Error deleting the file " + path("none") + " (No such file or directory).");
    EXPECT_EQ(errorOf([&] { manager()->deleteFile(at("\xFF")); }),
              "Error deleting the file " + path("\xEF\xBF\xBD") + " (No such file or directory).");
    EXPECT_THROW(manager()->deleteFile(at("keep")), CFileError);
    EXPECT_EQ(errorOf([&] { manager()->deleteFolder(at("none")); }),
              "Error deleting the folder " + path("none") + " (No such file or directory).");
}

TEST_F(FileSystemManager, CopiesTreesAsTheyAre) {
    makeTree(folder / "source");
    CTree before = readTree(folder / "source");
    manager()->copy(at("source"), at("copy"));
    EXPECT_EQ(readTree(folder / "copy"), before);
    EXPECT_EQ(readTree(folder / "source"), before);

    EXPECT_EQ(errorOf([&] { manager()->copy(at("source"), at("copy")); }),
              "Error copying file " + path("source") + " to " + path("copy") + ". The file already exists.");
    fs::create_directory_symlink(folder / "source/one", folder / "alias");
    for (const char* inside : {"source/one/x", "source/x", "alias/x"})
        EXPECT_THROW(manager()->copy(at("source"), toURI(folder / inside)), CFileError) << inside;
    EXPECT_EQ(readTree(folder / "source"), before);
    EXPECT_THROW(manager()->copy(at("none"), at("x")), CFileNotFoundError);
    tests::failEach(
        {{"fchmod", EPERM, true},
         {"fchmod", ENOTSUP, true},
         {"fchmod", EIO, false},
         {"futimens", EIO, false}},
        [&] { manager()->copy(at("source/empty"), at("x")); },
        [&](bool done) { EXPECT_EQ(fs::remove(folder / "x"), done); });
}

TEST_F(FileSystemManager, MovesWithinAVolume) {
    makeTree(folder / "source");
    CTree before = readTree(folder / "source");
    manager()->move(at("source/"), at("moved/"));
    EXPECT_EQ(readTree(folder / "moved"), before);
    EXPECT_FALSE(fs::exists(folder / "source"));

    folder.write("a", "1");
    folder.write("b", "2");
    auto failure = [&](const char* from, const char* to) {
        return errorOf([&] { manager()->move(toURI(folder / from), toURI(folder / to)); });
    };
    auto names = [&](const char* from, const char* to) { return path(from) + " to " + path(to) + "."; };
    EXPECT_EQ(failure("a", "b"), "Error moving file " + names("a", "b"));
    EXPECT_EQ(failure("moved", "b"),
              "Error moving folder " + names("moved", "b") + " The folder already exists.");
    EXPECT_EQ(failure("moved", "moved/one/x"), "Error moving folder " + names("moved", "moved/one/x"));
    EXPECT_EQ(failure("moved", "none/x"),
              "Error moving folder " + names("moved", "none/x") + " Could not create the folder.");
    EXPECT_EQ(readFile(folder / "b"), "2");
    EXPECT_EQ(readTree(folder / "moved"), before);
}

TEST_F(FileSystemManager, MovesBetweenVolumesOrLosesNothing) {
    COtherVolume other(folder.path());
    if (other.path.empty()) GTEST_SKIP() << "no second volume here";
    makeTree(folder / "source");
    // Nobody can copy a FIFO, not even root.
    const fs::path pipe = folder / "source/one/two/pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    CTree before = readTree(folder / "source");
    EXPECT_THROW(manager()->copy(at("source"), toURI(other.path / "copy")), CFileError);
    try {
        manager()->move(at("source"), toURI(other.path / "moved"));
        FAIL();
    } catch (const CFileError& error) {
        EXPECT_EQ(text(error.getDescription()),
                  "Error moving folder " + path("source") + " to '" + (other.path / "moved").string() + "'.");
        EXPECT_EQ(toPath(error.getURI()), pipe.string());
    }
    EXPECT_EQ(readTree(folder / "source"), before);
    EXPECT_TRUE(fs::is_empty(other.path));

    fs::remove(pipe);
    before = readTree(folder / "source");
    manager()->move(at("source"), toURI(other.path / "moved"));
    EXPECT_EQ(readTree(other.path / "moved"), before);
    EXPECT_FALSE(fs::exists(folder / "source"));
    manager()->move(toURI(other.path / "moved/a.txt"), at("a.txt"));
    manager()->move(toURI(other.path / "moved/one/two/dangling"), at("link"));
    EXPECT_EQ(fs::read_symlink(folder / "link"), "/nowhere/at/all");
    EXPECT_FALSE(fs::exists(fs::symlink_status(other.path / "moved/one/two/dangling")));

    std::ofstream(other.path / "taken") << "old";
    EXPECT_THROW(manager()->move(at("a.txt"), toURI(other.path / "taken")), CFileError);
    EXPECT_EQ(readFile(other.path / "taken"), "old");
    EXPECT_EQ(readFile(folder / "a.txt"), "alpha");
}

namespace {

// Maps its own scheme to a folder: "mirror:///x" is the folder's "x".
class CMirror : public CReadOnlyFileSystem {
public:
    explicit CMirror(fs::path folder) : m_folder(std::move(folder)) {}
    bool handles(const P<IURI>& uri) override { return uri->getScheme()->equals("mirror"); }
    P<IFileObject> getRoot() override { return nullptr; }
    P<IFileObject> getFileObject(const P<IURI>& uri) override {
        std::string path = text(uri->getUnescapedPath());
        return manager()->getFileObject(toURI(m_folder.string() + path));
    }

private:
    fs::path m_folder;
};

} // namespace

TEST_F(FileSystemManager, ServesWhatIsMounted) {
    makeTree(folder / "disc");
    fs::remove(folder / "disc/one/two/up");
    fs::remove(folder / "disc/one/two/dangling");
    const P<IURI> disc = make<CURI>("mirror:///one"), file = make<CURI>("mirror:///a.txt"),
                  fresh = make<CURI>("mirror:///new");
    EXPECT_FALSE(manager()->exists(disc));
    P<IFileSystem> mirror = make<CMirror>(folder / "disc");
    manager()->mount(mirror);
    EXPECT_TRUE(manager()->isFolder(disc));
    const std::function<void()> changes[] = {[&] { manager()->setTimes(file, manager()->getTimes(file)); },
                                             [&] { manager()->createFolder(fresh); },
                                             [&] { manager()->deleteFile(file); },
                                             [&] { manager()->deleteFolder(disc); },
                                             [&] { manager()->deleteUndoable(file); },
                                             [&] { manager()->copy(file, fresh); },
                                             [&] { manager()->copy(disc, fresh); },
                                             [&] { manager()->copy(at("disc/one"), fresh); },
                                             [&] { manager()->move(file, fresh); }};
    for (const auto& change : changes) EXPECT_THROW(change(), CReadOnlyError);
    // Between two file systems, through streams.
    manager()->copy(disc, at("copy"));
    EXPECT_EQ(readFile(folder / "copy/50% #?.wav"), "beta");
    EXPECT_EQ(readFile(folder / "copy/two/\xff\xe4 x\ny").size(), 300000u);
    EXPECT_EQ(readFile(folder / "copy/link"), "alpha");
    EXPECT_EQ(fs::last_write_time(folder / "copy/two"), fs::last_write_time(folder / "disc/one/two"));
    folder.write("taken", "old");
    EXPECT_EQ(errorOf([&] { manager()->copy(file, at("taken")); }),
              "Error copying file '" + text(file->getAsString()) + "' to " + path("taken") +
                  ". The file already exists.");
    EXPECT_EQ(readFile(folder / "taken"), "old");
    // A source that cannot be deleted is not moved: the copy is removed again.
    EXPECT_THROW(manager()->move(file, at("moved")), CException);
    EXPECT_FALSE(fs::exists(folder / "moved"));
    manager()->unmount(mirror);
    EXPECT_FALSE(manager()->exists(disc));
    manager()->mountScheme("other", mirror);
    EXPECT_TRUE(manager()->isFolder(make<CURI>("OTHER:///one")));
    manager()->unmount(mirror);
}

// In a separate process: GIO caches the user's folders.
TEST(FileSystemManagerDeathTest, UndoableDeleteFillsTheWasteBin) {
    testing::FLAGS_gtest_death_test_style = "threadsafe";
    auto deleteAndLook = [] {
        CTempFolder folder;
        tests::CEnvironment home("HOME", folder.path().string());
        tests::CEnvironment data("XDG_DATA_HOME", (folder / "data").string());
        fs::create_directory(folder / "data");
        fs::path file = folder.write("a b", "precious");
        manager()->deleteUndoable(toURI(file));
        bool kept = readFile(folder / "data/Trash/files/a b") == "precious";
        std::string message = errorOf([&] { manager()->deleteUndoable(toURI(file)); });
        return !fs::exists(file) && kept && message == "shell error 1";
    };
    EXPECT_EXIT(std::_Exit(deleteAndLook() ? 0 : 1), testing::ExitedWithCode(0), "");
}
