#include "peru/files/SystemCalls.h"
#include "peru/system/ISystem.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <csignal>
#include <fstream>
#include <sys/stat.h>
#include <sys/wait.h>
#include <sys/xattr.h>
#include <unistd.h>

using namespace peru;
using tests::countEntries;
using tests::CTempFolder;
using tests::readFile;
using tests::toURI;
namespace fs = std::filesystem;

namespace {

std::string getAttribute(const fs::path& file, const char* name) {
    char value[256];
    const ssize_t size = ::getxattr(file.c_str(), name, value, sizeof value);
    return size < 0 ? "none" : std::string(value, static_cast<size_t>(size));
}

// The usual permissions plus read permission for one more user.
void setAccessList(const fs::path& file, const char* name, uint32_t user) {
    struct SEntry {
        uint16_t tag, rights;
        uint32_t id;
    };
    constexpr uint32_t kNobody = 0xffffffff;
    // Owner, user, group, mask, others.
    const SEntry entries[] = {
        {1, 6, kNobody}, {2, 4, user}, {4, 4, kNobody}, {16, 6, kNobody}, {32, 0, kNobody}};
    std::string value("\2\0\0\0", 4);
    value.append(reinterpret_cast<const char*>(entries), sizeof entries);
    ASSERT_EQ(::setxattr(file.c_str(), name, value.data(), value.size(), 0), 0);
}

// Text in which every position is recognisable.
std::string makeText(size_t size) {
    std::string text;
    while (text.size() < size) text += std::to_string(text.size()) + " ";
    text.resize(size);
    return text;
}

class FileReplacement : public testing::Test {
protected:
    P<IFileReplacement> start(const std::string& name) const {
        return getSystem()->startReplacement(toURI(folder / name));
    }
    void replace(const std::string& name) const { getSystem()->replaceFile(toURI(folder / name), "new", 3); }

    const CTempFolder folder;
};

} // namespace

TEST_F(FileReplacement, LeavesHolesWhereTheyAre) {
    const fs::path file = folder.write("file", "head");
    constexpr int64_t kSize = int64_t{3} << 30;
    fs::resize_file(file, kSize);
    std::ofstream(file, std::ios::in).seekp(kSize / 2).write("middle", 6);
    const P<IFileReplacement> replacement = start("file");
    replacement->getStream()->write("+", 1);
    replacement->copyFromOld(0, kSize);
    replacement->commit();
    ASSERT_EQ(fs::file_size(file), static_cast<uintmax_t>(kSize + 1));
    struct stat status;
    ASSERT_EQ(::stat(file.c_str(), &status), 0);
    EXPECT_LT(status.st_blocks, 1000);
    std::ifstream in(file);
    char text[8] = {};
    in.read(text, 5);
    EXPECT_STREQ(text, "+head");
    in.seekg(kSize / 2 + 1).read(text, 7);
    EXPECT_EQ(std::string(text, 7), std::string("middle\0", 7));
}

TEST_F(FileReplacement, MixesOldAndNewBytes) {
    const std::string old = makeText(600000);
    const std::string wanted = "he" + old.substr(5, 3) + old.substr(11, 499999) + "middle" +
                               old.substr(599990) + old.substr(599990, 5);
    // Copied inside the kernel, and through a buffer where the file system does not support that.
    for (const int refusal : {0, EOPNOTSUPP}) {
        const tests::CSystemCalls calls([&](const std::string& call, int) {
            return call == "copy_file_range" ? refusal : tests::interrupt(call, 0);
        });
        const fs::path file = folder.write("file", old);
        const P<IFileReplacement> replacement = start("file");
        const P<ISeekableIOStream> stream = replacement->getStream();
        stream->write("head", 4);
        replacement->copyFromOld(10, 500000);
        stream->write("middle", 6);
        replacement->copyFromOld(0, 0);
        replacement->copyFromOld(599990, 10);
        char bytes[8];
        stream->seek(0); // buffered by a read, then overwritten by a range
        stream->read(bytes, 8);
        EXPECT_EQ(std::string(bytes, 8), "head" + old.substr(10, 4));
        stream->seek(2);
        replacement->copyFromOld(5, 3);
        stream->read(bytes, 3);
        EXPECT_EQ(std::string(bytes, 3), old.substr(11, 3));
        stream->seek(500020);
        replacement->copyFromOld(599990, 10);
        stream->setSize(500025);
        EXPECT_THROW(start("file")->copyFromOld(599999, 2), CFileError);
        // Not compared by EXPECT_EQ, which would print them.
        EXPECT_TRUE(readFile(file) == old) << "nothing happens before the commit";
        EXPECT_EQ(countEntries(folder.path()), 1u);
        replacement->commit();
        EXPECT_TRUE(readFile(file) == wanted);
        EXPECT_EQ(countEntries(folder.path()), 1u);
    }
}

TEST_F(FileReplacement, TakesOverWhatSurroundsTheBytes) {
    const fs::path file = folder.write("file", "old");
    fs::create_symlink("file", folder / "link");
    fs::create_hard_link(file, folder / "second name");
    ASSERT_EQ(::setxattr(file.c_str(), "user.note", "kept", 4, 0), 0);
    setAccessList(file, "system.posix_acl_access", 1234);
    // New files inherit this list from the folder.
    setAccessList(folder.path(), "system.posix_acl_default", 4321);
    const fs::path plain = folder.write("plain", "old");
    ASSERT_EQ(::removexattr(plain.c_str(), "system.posix_acl_access"), 0);
    const bool root = ::geteuid() == 0;
    if (root) {
        ASSERT_EQ(::chown(file.c_str(), 1000, 1001), 0);
    }
    fs::permissions(plain, fs::perms(0640));
    const std::string listBefore = getAttribute(file, "system.posix_acl_access");

    replace("link");
    replace("plain");
    EXPECT_EQ(readFile(file), "new");
    EXPECT_EQ(readFile(folder / "second name"), "old") << "never written in place";
    EXPECT_TRUE(fs::is_symlink(folder / "link"));
    EXPECT_EQ(getAttribute(file, "user.note"), "kept");
    EXPECT_EQ(getAttribute(file, "system.posix_acl_access"), listBefore);
    EXPECT_EQ(fs::status(plain).permissions(), fs::perms(0640));
    EXPECT_EQ(getAttribute(plain, "system.posix_acl_access"), "none");
    if (root) {
        struct stat status;
        ASSERT_EQ(::stat(file.c_str(), &status), 0);
        EXPECT_EQ(status.st_uid, 1000u);
        EXPECT_EQ(status.st_gid, 1001u);
    }
}

TEST_F(FileReplacement, ReportsFailedCallsAndKeepsTheOldFile) {
    const fs::path file = folder.write("file", "precious");
    ASSERT_EQ(::setxattr(file.c_str(), "user.note", "kept", 4, 0), 0);
    const auto run = [&] {
        const P<IFileReplacement> replacement = start("file");
        replacement->copyFromOld(0, 8);
        replacement->commit();
    };
    tests::failEach({{"pread", EIO, false},
                     {"pwrite", ENOSPC, false},
                     {"fsync", EIO, false},
                     {"rename", EIO, false},
                     {"fchmod", EPERM, true},
                     {"fchmod", EIO, false},
                     {"fsetxattr", EIO, false},
                     {"fsetxattr", EPERM, true},
                     {"fsetxattr", EACCES, true},
                     {"fsetxattr", ENOTSUP, true}},
                    run, [&](bool) {
                        EXPECT_EQ(readFile(file), "precious");
                        EXPECT_EQ(countEntries(folder.path()), 1u);
                    });
}

// Attributes that grow while they are read, and another user's file whose owner or group cannot be taken
// over.
TEST_F(FileReplacement, TakesOverNoMoreThanItMay) {
    if (::geteuid() != 0 || !tests::CSystemCalls::kWatchesAll) GTEST_SKIP() << "only root may change owners";
    const fs::path file = folder / "file";
    for (const auto& [refused, mode] : {std::pair(0, 06754u), {1, 0754u}, {2, 0744u}}) {
        ASSERT_EQ(::chown(folder.write("file", "old").c_str(), 1000, 1001), 0);
        ASSERT_EQ(::chmod(file.c_str(), 06754), 0);
        ASSERT_EQ(::setxattr(file.c_str(), "user.note", "kept", 4, 0), 0);
        int owners = 0, lists = 0, values = 0;
        const tests::CSystemCalls calls([&](const std::string& call, int) {
            if (call == "flistxattr" || call == "fgetxattr")
                return ++(call == "flistxattr" ? lists : values) == 2 ? ERANGE : 0;
            return call == "fchown" && owners++ < refused ? EPERM : 0;
        });
        replace("file");
        struct stat status;
        ASSERT_EQ(::stat(file.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777, mode) << refused;
        EXPECT_EQ(status.st_gid, refused < 2 ? 1001u : 0u);
        EXPECT_EQ(getAttribute(file, "user.note"), "kept");
        fs::remove(file);
    }
}

// Permissions are checked as an ordinary user, even if the tests run as root.
TEST_F(FileReplacement, RefusesWhatTheUserMayNotWrite) {
    const fs::path locked = folder.write("locked", "precious");
    const fs::path inside = folder.write("group", "precious");
    fs::permissions(locked, fs::perms(0444));
    const bool root = ::geteuid() == 0;
    if (root) {
        ASSERT_EQ(::chown(folder.path().c_str(), 65534, 65534), 0);
        ASSERT_EQ(::chown(locked.c_str(), 65534, 65534), 0);
        fs::permissions(inside, fs::perms(0666));
        ASSERT_EQ(::seteuid(65534), 0);
    }
    EXPECT_THROW(start("locked"), CFileAccessDeniedError);
    fs::permissions(folder.path(), fs::perms(0555));
    EXPECT_THROW(start("group"), CFileAccessDeniedError);
    EXPECT_THROW(start("fresh"), CFileAccessDeniedError);
    fs::permissions(folder.path(), fs::perms(0755));
    if (root) {
        EXPECT_EQ(::seteuid(0), 0);
    }
    EXPECT_THROW(getSystem()->startReplacement(toURI(folder.path())), CFileError);
    ASSERT_EQ(::mkfifo((folder / "pipe").c_str(), 0600), 0);
    EXPECT_THROW(start("pipe"), CFileError);
    EXPECT_EQ(readFile(locked), "precious");
    EXPECT_EQ(countEntries(folder.path()), 3u);
}

TEST_F(FileReplacement, LeavesNothingWithoutCommit) {
    const fs::path file = folder.write("file", "old");
    // Once abandoned regularly, once by a process that is killed half way.
    start("file")->getStream()->write("new", 3);
    const pid_t child = ::fork();
    if (child == 0) {
        const P<IFileReplacement> replacement = start("file");
        replacement->getStream()->write("new", 3);
        replacement->getStream()->flush();
        ::kill(::getpid(), SIGKILL);
    }
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status));
    EXPECT_EQ(readFile(file), "old");
    EXPECT_EQ(countEntries(folder.path()), 1u);
}

TEST_F(FileReplacement, CreatesWhatADanglingLinkOrARelativePathNames) {
    fs::create_directory(folder / "sub");
    fs::create_symlink("sub/second", folder / "first");
    fs::create_symlink("new", folder / "sub/second");
    fs::create_symlink("circle", folder / "circle");
    replace("first");
    EXPECT_EQ(readFile(folder / "sub/new"), "new");
    EXPECT_TRUE(fs::is_symlink(folder / "first") && fs::is_symlink(folder / "sub/second"));
    EXPECT_THROW(start("circle"), CFileError);

    const fs::path before = fs::current_path();
    fs::current_path(folder.path());
    getSystem()->replaceFile(toURI("relative"), "new", 3);
    fs::current_path(before);
    EXPECT_EQ(readFile(folder / "relative"), "new");
    EXPECT_EQ(countEntries(folder.path()), 4u);
}

// The bytes reach the disk before the name does, also on a file system that has no hard links.
TEST_F(FileReplacement, SyncsBeforeItRenamesAndIsPrivateUntilThen) {
    const mode_t mask = ::umask(022);
    for (const bool hasLinks : {true, false})
        for (const mode_t mode : {0600u, 0644u, 0u}) { // 0: the file is new
            SCOPED_TRACE(std::to_string(hasLinks) + " " + std::to_string(mode));
            const CTempFolder folder;
            const fs::path file = folder / "file";
            if (mode != 0) fs::permissions(folder.write("file", "old"), fs::perms(mode));
            std::vector<std::string> calls;
            const P<IFileReplacement> replacement = getSystem()->startReplacement(toURI(file));
            replacement->getStream()->write("new", 3);
            {
                const tests::CSystemCalls watch([&](const std::string& call, int descriptor) {
                    struct stat status = {};
                    if (call == "copy_file_range" && ::fstat(descriptor, &status) == 0) {
                        EXPECT_EQ(status.st_mode & 0777, 0600u);
                    }
                    calls.push_back(call);
                    return call == "linkat" && !hasLinks ? EPERM : 0;
                });
                replacement->commit();
            }
            EXPECT_EQ(readFile(file), "new");
            EXPECT_EQ(fs::status(file).permissions(), fs::perms(mode != 0 ? mode : 0644));
            EXPECT_EQ(countEntries(folder.path()), 1u);
            const auto renamed = std::find(calls.begin(), calls.end(), "rename");
            ASSERT_NE(renamed, calls.end());
            // Without links the bytes end up in a second file, which needs an fsync of its own.
            EXPECT_EQ(std::count(calls.begin(), renamed, "fsync"), hasLinks ? 1 : 2);
            EXPECT_EQ(std::count(renamed, calls.end(), "fsync"), 1) << "of the folder";
        }
    ::umask(mask);
}
