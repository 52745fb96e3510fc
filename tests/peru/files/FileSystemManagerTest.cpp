#include "peru/files/IFileSystemManager.h"

#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include "peru/files/ReadOnlyFileSystem.h"
#include "peru/uri/URI.h"

#include <fcntl.h>
#include <map>
#include <sys/stat.h>
#include <unistd.h>

using namespace peru;
using tests::CTempFolder;
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
                    (entry.is_regular_file() ? tests::readFile(entry.path()) : "");
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

} // namespace

TEST(FileSystemManager, TellsWhatIsThere) {
    CTempFolder folder;
    P<IURI> file = toURI(folder.write(".hidden", "12345"));
    fs::create_symlink(folder / "none", folder / "dangling");
    fs::create_directory_symlink(folder.path(), folder / "self");
    P<IURI> dangling = toURI(folder / "dangling");
    P<IURI> self = toURI(folder / "self");
    P<IURI> missing = toURI(folder / "missing");

    EXPECT_TRUE(manager()->isFile(file));
    EXPECT_FALSE(manager()->isFolder(file));
    EXPECT_EQ(manager()->getFileSize(file), 5);
    EXPECT_TRUE(manager()->getAttributes(file).hidden);
    chmod((folder / ".hidden").c_str(), 0555);
    EXPECT_TRUE(manager()->getAttributes(file).readOnly);
    EXPECT_TRUE(manager()->getAttributes(file).executable);

    EXPECT_TRUE(manager()->exists(dangling));
    EXPECT_FALSE(manager()->isFile(dangling) || manager()->isFolder(dangling));
    EXPECT_TRUE(manager()->isFolder(self));
    EXPECT_TRUE(manager()->getAttributes(self).link);
    EXPECT_FALSE(manager()->exists(missing));
    EXPECT_FALSE(manager()->exists(make<CURI>("http://host/a")));
    EXPECT_FALSE(manager()->getFileObject(missing));
    EXPECT_THROW(manager()->getFileSize(missing), CFileNotFoundError);
    EXPECT_THROW(manager()->getFileSize(make<CURI>("http://host/a")), CURITypeNotSupportedError);
}

TEST(FileSystemManager, EnumeratesEveryNameOnce) {
    CTempFolder folder;
    makeTree(folder.path());
    std::map<std::string, std::string> found;
    P<IFileObjectCursor> cursor = manager()->enumerate(toURI(folder / "one"));
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
    EXPECT_EQ(tests::errorOf([&] { manager()->enumerate(toURI(folder / "a.txt")); }),
              "'" + (folder / "a.txt").string() + "' is not a folder.");
    EXPECT_THROW(manager()->enumerate(toURI(folder / "none")), CFileNotFoundError);
}

TEST(FileSystemManager, KeepsTimesToTheNanosecond) {
    CTempFolder folder;
    P<IURI> file = toURI(folder.write("a", ""));
    manager()->setTimes(file, make<CFileTimes>(CFileTimes::kUnknown, -1500000001, 1234567890123456789));
    P<CFileTimes> times = manager()->getTimes(file);
    EXPECT_EQ(times->getLastAccessTime(), -1500000001);
    EXPECT_EQ(times->getLastWriteTime(), 1234567890123456789);
    manager()->setTimes(file, make<CFileTimes>(0, CFileTimes::kUnknown, 5));
    EXPECT_EQ(manager()->getTimes(file)->getLastAccessTime(), -1500000001);
    EXPECT_EQ(manager()->getTimes(file)->getLastWriteTime(), 5);
    EXPECT_THROW(manager()->setTimes(toURI(folder / "none"), times), CFileError);
}

TEST(FileSystemManager, CreatesParentsOrNothing) {
    CTempFolder folder;
    manager()->createFolder(toURI(folder / "a/b/c/"));
    manager()->createFolder(toURI(folder / "a/b/c"));
    EXPECT_TRUE(fs::is_directory(folder / "a/b/c"));
    folder.write("a/file", "");
    EXPECT_EQ(tests::errorOf([&] { manager()->createFolder(toURI(folder / "a/file")); }),
              "Error creating the folder '" + (folder / "a/file").string() + "' (File exists).");
    std::string tooLong = (folder / "x/y").string() + "/" + std::string(300, 'n');
    EXPECT_THROW(manager()->createFolder(toURI(tooLong)), CFileError);
    EXPECT_FALSE(fs::exists(folder / "x"));
}

TEST(FileSystemManager, DeletesWithoutFollowingLinks) {
    CTempFolder folder;
    fs::create_directory(folder / "keep");
    folder.write("keep/a", "1");
    makeTree(folder / "gone");
    fs::create_directory_symlink(folder / "keep", folder / "gone/link");
    fs::create_directory_symlink(folder / "keep", folder / "direct");
    EXPECT_EQ(tests::errorOf([&] { manager()->deleteFolder(toURI(folder / "direct/")); }),
              "Error deleting the folder '" + (folder / "direct/").string() + "' (Not a directory).");
    manager()->deleteFile(toURI(folder / "direct"));
    manager()->deleteFolder(toURI(folder / "gone"));
    EXPECT_EQ(readTree(folder.path()).size(), 2u);
    EXPECT_EQ(tests::readFile(folder / "keep/a"), "1");

    EXPECT_EQ(tests::errorOf([&] { manager()->deleteFile(toURI(folder / "none")); }),
              "Error deleting the file '" + (folder / "none").string() + "' (No such file or directory).");
    EXPECT_THROW(manager()->deleteFile(toURI(folder / "keep")), CFileError);
    EXPECT_EQ(tests::errorOf([&] { manager()->deleteFolder(toURI(folder / "none")); }),
              "Error deleting the folder '" + (folder / "none").string() + "' (No such file or directory).");
}

TEST(FileSystemManager, CopiesTreesAsTheyAre) {
    CTempFolder folder;
    makeTree(folder / "source");
    CTree before = readTree(folder / "source");
    manager()->copy(toURI(folder / "source"), toURI(folder / "copy"));
    EXPECT_EQ(readTree(folder / "copy"), before);
    EXPECT_EQ(readTree(folder / "source"), before);

    std::string names = "'" + (folder / "source").string() + "' to '" + (folder / "copy").string() + "'";
    EXPECT_EQ(tests::errorOf([&] { manager()->copy(toURI(folder / "source"), toURI(folder / "copy")); }),
              "Error copying file " + names + ". The file already exists.");
    fs::create_directory_symlink(folder / "source/one", folder / "alias");
    for (const char* inside : {"source/one/x", "source/x", "alias/x"})
        EXPECT_THROW(manager()->copy(toURI(folder / "source"), toURI(folder / inside)), CFileError) << inside;
    EXPECT_EQ(readTree(folder / "source"), before);
    EXPECT_THROW(manager()->copy(toURI(folder / "none"), toURI(folder / "x")), CFileNotFoundError);
}

TEST(FileSystemManager, TakesAFailedCopyBack) {
    CTempFolder folder;
    makeTree(folder / "source");
    ASSERT_EQ(mkfifo((folder / "source/one/two/pipe").c_str(), 0600), 0);
    CTree before = readTree(folder / "source");
    EXPECT_THROW(manager()->copy(toURI(folder / "source"), toURI(folder / "copy")), CFileError);
    EXPECT_FALSE(fs::exists(folder / "copy"));
    EXPECT_EQ(readTree(folder / "source"), before);
}

TEST(FileSystemManager, MovesWithinAVolume) {
    CTempFolder folder;
    makeTree(folder / "source");
    CTree before = readTree(folder / "source");
    manager()->move(toURI(folder / "source/"), toURI(folder / "moved/"));
    EXPECT_EQ(readTree(folder / "moved"), before);
    EXPECT_FALSE(fs::exists(folder / "source"));

    folder.write("a", "1");
    folder.write("b", "2");
    auto failure = [&](const char* from, const char* to) {
        return tests::errorOf([&] { manager()->move(toURI(folder / from), toURI(folder / to)); });
    };
    auto names = [&](const char* from, const char* to) {
        return "'" + (folder / from).string() + "' to '" + (folder / to).string() + "'.";
    };
    EXPECT_EQ(failure("a", "b"), "Error moving file " + names("a", "b"));
    EXPECT_EQ(failure("moved", "b"),
              "Error moving folder " + names("moved", "b") + " The folder already exists.");
    EXPECT_EQ(failure("moved", "moved/one/x"), "Error moving folder " + names("moved", "moved/one/x"));
    EXPECT_EQ(failure("moved", "none/x"),
              "Error moving folder " + names("moved", "none/x") + " Could not create the folder.");
    EXPECT_EQ(tests::readFile(folder / "b"), "2");
    EXPECT_EQ(readTree(folder / "moved"), before);
}

TEST(FileSystemManager, MovesBetweenVolumes) {
    CTempFolder folder;
    COtherVolume other(folder.path());
    if (other.path.empty()) GTEST_SKIP() << "no second volume here";
    makeTree(folder / "source");
    CTree before = readTree(folder / "source");
    manager()->move(toURI(folder / "source"), toURI(other.path / "moved"));
    EXPECT_EQ(readTree(other.path / "moved"), before);
    EXPECT_FALSE(fs::exists(folder / "source"));

    manager()->move(toURI(other.path / "moved/a.txt"), toURI(folder / "a.txt"));
    manager()->move(toURI(other.path / "moved/one/two/dangling"), toURI(folder / "link"));
    EXPECT_EQ(fs::read_symlink(folder / "link"), "/nowhere/at/all");
    EXPECT_FALSE(fs::exists(fs::symlink_status(other.path / "moved/one/two/dangling")));

    std::ofstream(other.path / "taken") << "old";
    EXPECT_THROW(manager()->move(toURI(folder / "a.txt"), toURI(other.path / "taken")), CFileError);
    EXPECT_EQ(tests::readFile(other.path / "taken"), "old");
    EXPECT_EQ(tests::readFile(folder / "a.txt"), "alpha");
}

TEST(FileSystemManager, LosesNothingWhenAMoveBetweenVolumesFails) {
    CTempFolder folder;
    COtherVolume other(folder.path());
    if (other.path.empty()) GTEST_SKIP() << "no second volume here";
    makeTree(folder / "source");
    // Nobody can copy a FIFO, not even root.
    ASSERT_EQ(mkfifo((folder / "source/one/two/pipe").c_str(), 0600), 0);
    CTree before = readTree(folder / "source");
    try {
        manager()->move(toURI(folder / "source"), toURI(other.path / "moved"));
        FAIL();
    } catch (const CFileError& error) {
        EXPECT_EQ(text(error.getDescription()), "Error moving folder '" + (folder / "source").string() +
                                                    "' to '" + (other.path / "moved").string() + "'.");
        EXPECT_EQ(toPath(error.getURI()), (folder / "source/one/two/pipe").string());
    }
    EXPECT_EQ(readTree(folder / "source"), before);
    EXPECT_TRUE(fs::is_empty(other.path));
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

TEST(FileSystemManager, ServesWhatIsMounted) {
    CTempFolder folder;
    makeTree(folder / "disc");
    fs::remove(folder / "disc/one/two/up");
    fs::remove(folder / "disc/one/two/dangling");
    P<IURI> disc = make<CURI>("mirror:///one");
    EXPECT_FALSE(manager()->exists(disc));
    P<IFileSystem> mirror = make<CMirror>(folder / "disc");
    manager()->mount(mirror);
    EXPECT_TRUE(manager()->isFolder(disc));
    EXPECT_THROW(manager()->deleteFolder(disc), CReadOnlyError);
    // Between two file systems, through streams.
    manager()->copy(disc, toURI(folder / "copy"));
    EXPECT_EQ(tests::readFile(folder / "copy/50% #?.wav"), "beta");
    EXPECT_EQ(tests::readFile(folder / "copy/two/\xff\xe4 x\ny").size(), 300000u);
    EXPECT_EQ(tests::readFile(folder / "copy/link"), "alpha");
    EXPECT_EQ(fs::last_write_time(folder / "copy/two"), fs::last_write_time(folder / "disc/one/two"));
    EXPECT_THROW(manager()->copy(toURI(folder / "copy"), make<CURI>("mirror:///new")), CReadOnlyError);
    // A source that cannot be deleted is not moved: the copy is removed again.
    EXPECT_THROW(manager()->move(make<CURI>("mirror:///a.txt"), toURI(folder / "moved")), CException);
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
        bool kept = tests::readFile(folder / "data/Trash/files/a b") == "precious";
        std::string message = tests::errorOf([&] { manager()->deleteUndoable(toURI(file)); });
        return !fs::exists(file) && kept && message == "shell error 1";
    };
    EXPECT_EXIT(std::_Exit(deleteAndLook() ? 0 : 1), testing::ExitedWithCode(0), "");
}
