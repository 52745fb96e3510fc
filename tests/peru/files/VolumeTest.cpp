#include "support/Files.h"
#include "support/TempFolder.h"

#include "peru/files/MountTable.h"
#include "peru/files/posix/FileSystemVolume.h"
#include "peru/files/posix/VolumeManager.h"
#include "peru/threads/ISignal.h"

#include <chrono>
#include <sched.h>
#include <sys/mount.h>
#include <sys/statvfs.h>
#include <sys/sysmacros.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

using namespace peru;
using tests::CTempFolder;
using tests::errorOf;
using tests::text;
using tests::toPath;

namespace {

std::string makeLine(const std::string& device, const std::string& root, const std::string& mountPoint,
                     const std::string& kind) {
    return "36 35 " + device + " " + root + " " + mountPoint + " rw,relatime shared:1 master:2 - " + kind +
           " rw\n";
}

std::vector<std::string> selectPoints(const std::string& table) {
    std::vector<std::string> points;
    for (const SMount& mount : selectVolumes(parseMountTable(table))) points.push_back(mount.mountPoint);
    return points;
}

class CTestListener : public CObject, public IFileSystemVolumeListener {
public:
    void volumeArrived(const P<IFileSystemVolume>& volume) override { note("+", volume); }
    void volumeLeft(const P<IFileSystemVolume>& volume) override { note("-", volume); }

    posix::CVolumeManager* leave = nullptr; // removes itself during its next call
    std::vector<std::string> log;

private:
    void note(const char* what, const P<IFileSystemVolume>& volume) {
        log.push_back(what + text(volume->getLabel()));
        if (leave) leave->removeListener(this);
        throw 1; // must not affect the other listeners
    }
};

} // namespace

TEST(MountTable, ReadsTheKernelsLines) {
    std::vector<SMount> mounts =
        parseMountTable("22 1 8:1 /@home /home/a\\040b\\134\\011 ro,nosuid - ext4 /dev/sda1 rw,errors=x\n"
                        "junk\n1 2 3 4 5 6 - a b\n1 2 0:5 / /y rw - tmpfs none\n\n1 2 0:5 / /x rw shared:1 "
                        "master:2 - tmpfs none ro");
    std::vector<std::string> found;
    for (const SMount& m : mounts)
        found.push_back(m.device + "," + m.root + "," + m.mountPoint + "," + m.fileSystem + "," + m.source +
                        (m.readOnly ? ",ro" : ""));
    EXPECT_EQ(found, (std::vector<std::string>{"8:1,/@home,/home/a b\\\t,ext4,/dev/sda1,ro",
                                               "0:5,/,/x,tmpfs,none,ro"}));
}

TEST(MountTable, SelectsWhatAUserCallsAVolume) {
    const std::string table =
        makeLine("0:20", "/", "/proc", "proc proc") + makeLine("0:21", "/", "/sys", "sysfs sysfs") +
        makeLine("8:1", "/part", "/bind", "ext4 /dev/sda1") + makeLine("8:1", "/", "/", "ext4 /dev/sda1") +
        makeLine("8:1", "/etc", "/other", "ext4 /dev/sda1") + makeLine("0:22", "/", "/run", "tmpfs tmpfs") +
        makeLine("0:40", "/", "/mnt/share", "nfs4 server:/x") +
        makeLine("0:41", "/", "/run/user/1/gvfs", "fuse.gvfsd-fuse gvfsd-fuse") +
        makeLine("0:42", "/", "/mnt/far", "fuse.sshfs me@far:") +
        makeLine("8:17", "/", "/media/stick", "vfat /dev/sdb1") +
        makeLine("8:33", "/", "/media/stick", "vfat /dev/sdc1");
    EXPECT_EQ(selectPoints(table), (std::vector<std::string>{"/", "/mnt/share", "/mnt/far", "/media/stick"}));
}

TEST(VolumeManager, KnowsTheVolumeOfAFile) {
    P<IVolumeManager> manager = getVolumeManager();
    std::string file = std::filesystem::read_symlink("/proc/self/exe").string();
    EXPECT_FALSE(manager->getVolumeOf(tests::toURI("/proc/self/status")));
    P<IFileSystemVolume> volume = manager->getVolumeOf(tests::toURI(file));
    if (!volume) GTEST_SKIP() << "the tests run from no volume";
    EXPECT_TRUE(file.starts_with(toPath(volume->getRoot())));
    struct statvfs status;
    ASSERT_EQ(statvfs(file.c_str(), &status), 0);
    EXPECT_EQ(volume->getTotalBytes(), static_cast<int64_t>(status.f_blocks * status.f_frsize));
    EXPECT_GE(volume->getTotalBytes(), volume->getFreeBytes());
    EXPECT_GE(volume->getFreeBytes(), 0);
}

TEST(VolumeManager, TellsWhatLeftAndArrived) {
    CTempFolder folder;
    for (const char* name : {"a", "b", "c"}) std::filesystem::create_directory(folder / name);
    auto line = [&](const char* device, const char* name) {
        return makeLine(device, "/", (folder / name).string(), "ext4 /dev/none");
    };
    std::string table = folder.write("table", line("99:1", "a") + line("99:2", "b")).string();
    P<posix::CVolumeManager> manager = make<posix::CVolumeManager>(table);
    P<CTestListener> stays = make<CTestListener>(), leaves = make<CTestListener>();
    std::filesystem::create_directory(folder / "ab");
    const std::string outer = makeLine("99:9", "/", folder.path().string(), "ext4 /dev/none");
    const auto nested =
        make<posix::CVolumeManager>(folder.write("nested", line("99:1", "a") + outer).string());
    EXPECT_EQ(toPath(nested->getVolumeOf(tests::toURI(folder / "a/x"))->getRoot()), (folder / "a/").string());
    EXPECT_EQ(toPath(nested->getVolumeOf(tests::toURI(folder / "ab"))->getRoot()), (folder / "").string());
    manager->addListener(stays.get());
    manager->addListener(leaves.get());
    leaves->leave = manager.get();
    manager->update();
    EXPECT_TRUE(stays->log.empty());

    P<IFileSystemVolume> gone = manager->getVolumes()[0];
    EXPECT_EQ(text(gone->getFileSystemName()), "ext4");
    const auto device = tryCast<posix::IPosixFileSystemVolume>(gone);
    EXPECT_EQ(text(device->getSource()) + " " + text(device->getDeviceNumber()), "/dev/none 99:1");
    EXPECT_FALSE(gone->isRemovable());
    folder.write("table", line("99:2", "b") + line("99:3", "c"));
    manager->update();
    EXPECT_EQ(stays->log, (std::vector<std::string>{"-a", "+c"}));
    EXPECT_EQ(leaves->log, (std::vector<std::string>{"-a"}));

    std::filesystem::remove(folder / "a");
    std::string place = (folder / "a").string() + "/";
    EXPECT_EQ(errorOf([&] { gone->getFreeBytes(); }),
              "Error getting the storage properties for drive letter '" + place +
                  "' (No such file or directory).");
    stays->leave = manager.get();
    folder.write("table", "");
    manager->update();
    EXPECT_EQ(stays->log.size(), 3u);
    // Starts again from the current state.
    manager->addListener(leaves.get());
    folder.write("table", line("99:1", "b"));
    manager->update();
    EXPECT_EQ(leaves->log.back(), "+b");
    manager->removeListener(leaves.get());
}

TEST(VolumeManager, WatchesOnlyWhileSomebodyListens) {
    const auto countThreads = [] { return tests::countEntries("/proc/self/task"); };
    // The kernel lists a thread for a moment after it has been joined.
    auto comesDownTo = [&](auto count) {
        auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (countThreads() != count && std::chrono::steady_clock::now() < deadline)
            std::this_thread::yield();
        return countThreads() == count;
    };
    P<posix::CVolumeManager> manager = make<posix::CVolumeManager>();
    P<CTestListener> first = make<CTestListener>(), second = make<CTestListener>();
    std::thread([] {}).join(); // a sanitizer starts its own thread along with the first one
    auto before = countThreads();
    for (int i = 0; i < 50; ++i) {
        manager->addListener(first.get());
        manager->addListener(second.get());
        manager->removeListener(first.get());
        ASSERT_EQ(countThreads(), before + 1);
        manager->removeListener(second.get());
        ASSERT_TRUE(comesDownTo(before));
    }
}

TEST(VolumeManager, FindsTheLabelsOfDevices) {
    const CTempFolder folder;
    const pid_t child = ::fork();
    if (child == 0) {
        // A device folder of its own.
        if (::unshare(CLONE_NEWNS) != 0 ||
            ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0 ||
            ::mount("dev", "/dev", "tmpfs", 0, nullptr) != 0)
            ::_exit(2);
        for (const dev_t number : {1, 2, 3})
            if (::mknod(("/dev/d" + std::to_string(number)).c_str(), S_IFBLK | 0600, makedev(7, number)) != 0)
                ::_exit(2);
        std::filesystem::create_directories("/dev/disk/by-label");
        std::filesystem::create_symlink("/dev/d1", "/dev/disk/by-label/One");
        std::filesystem::create_symlink("/dev/d2", "/dev/disk/by-label/\\x41\\x20\\xc3\\xa4\\x4\\x5g\\");
        std::string labels;
        for (const char* source : {"d1", "d2", "d3", "disk", "none"}) {
            const std::string line = makeLine("99:1", "/", "/some/point", std::string("ext4 /dev/") + source);
            const auto manager = make<posix::CVolumeManager>(folder.write("table", line).string());
            labels += text(manager->getVolumes()[0]->getLabel()) + "|";
        }
        ::_exit(labels == "One|A \xC3\xA4\\x4\\x5g\\|point|point|point|" ? 0 : 1);
    }
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    if (WEXITSTATUS(status) == 2) GTEST_SKIP() << "this user may not create devices";
    EXPECT_EQ(status, 0);
}

// In a child with mounts of its own.
TEST(VolumeManager, ReportsWhatIsMountedWhileItWatches) {
    class CSignalling : public CObject, public IFileSystemVolumeListener {
    public:
        void volumeArrived(const P<IFileSystemVolume>&) override { arrived->set(); }
        void volumeLeft(const P<IFileSystemVolume>&) override { left->set(); }
        const P<ISignal> arrived = getSignalFactory()->createSignal(),
                         left = getSignalFactory()->createSignal();
    };
    const CTempFolder folder;
    const pid_t child = ::fork();
    if (child == 0) {
        if (::unshare(CLONE_NEWNS) != 0 && ::unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) ::_exit(2);
        if (::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) ::_exit(2);
        const P<CSignalling> listener = make<CSignalling>();
        getVolumeManager()->addListener(listener.get());
        if (::mount("/dev/volume", folder.path().c_str(), "tmpfs", 0, nullptr) != 0) ::_exit(2);
        if (!listener->arrived->wait(20000)) ::_exit(3);
        ::umount(folder.path().c_str());
        ::_exit(listener->left->wait(20000) ? 0 : 4);
    }
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    if (WEXITSTATUS(status) == 2) GTEST_SKIP() << "this user may not mount anything";
    EXPECT_EQ(status, 0);
}
