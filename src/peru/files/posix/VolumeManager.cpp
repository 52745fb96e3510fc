#include "peru/files/posix/VolumeManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/posix/PlatformFile.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <poll.h>
#include <sstream>
#include <sys/eventfd.h>
#include <unistd.h>

namespace peru::posix {

// The body of the watching thread. The manager waits for it before it is destroyed.
class CMountWatcher : public CObject, public IAction {
public:
    CMountWatcher(CVolumeManager* manager, const std::string& mountTable)
        : m_manager(manager), m_table(::open(mountTable.c_str(), O_RDONLY | O_CLOEXEC)),
          m_stop(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {
        if (!m_table.isOpen() || !m_stop.isOpen()) throw CError(getSystemText(errno));
    }

    void stop() {
        uint64_t one = 1;
        static_cast<void>(!::write(m_stop.get(), &one, sizeof one));
    }

    void run() override {
        for (;;) {
            pollfd files[2] = {{m_table.get(), POLLPRI, 0}, {m_stop.get(), POLLIN, 0}};
            if (::poll(files, 2, -1) < 0 && errno != EINTR) return;
            if (files[1].revents != 0) return;
            // A change of the table is reported as an error as well.
            if (files[0].revents & POLLNVAL) return;
            if (files[0].revents & (POLLPRI | POLLERR)) m_manager->updateFrom(this);
        }
    }

private:
    CVolumeManager* m_manager;
    CFileHandle m_table;
    CFileHandle m_stop;
};

namespace {

bool isSame(const P<CFileSystemVolume>& a, const P<CFileSystemVolume>& b) {
    return a->getMount().device == b->getMount().device &&
           a->getMount().mountPoint == b->getMount().mountPoint;
}

bool isFolder(const std::string& path) {
    std::error_code error;
    return std::filesystem::is_directory(path, error) || error;
}

} // namespace

CVolumeManager::CVolumeManager(std::string mountTable)
    : m_mountTable(std::move(mountTable)), m_mutex(getMutexFactory()->createMutex()),
      m_listeners(make<TFrailArray<IFileSystemVolumeListener>>()) {}

CVolumeManager::~CVolumeManager() {
    if (m_watch.watcher) {
        m_watch.watcher->stop();
        m_retired.push_back(m_watch);
    }
    waitForRetired();
}

CVolumeManager::CVolumes CVolumeManager::readVolumes() const {
    std::ifstream file(m_mountTable, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    std::vector<SMount> mounts = parseMountTable(text.str());
    // Single files may be mounted as well; leave those out. A mount that cannot be examined, such as an
    // unreachable share, is kept.
    std::erase_if(mounts, [](const SMount& mount) { return !isFolder(mount.mountPoint); });
    CVolumes volumes;
    for (const SMount& mount : selectVolumes(mounts)) volumes.push_back(make<CFileSystemVolume>(mount));
    return volumes;
}

std::vector<P<IFileSystemVolume>> CVolumeManager::getVolumes() {
    CVolumes volumes = readVolumes();
    return {volumes.begin(), volumes.end()};
}

P<IFileSystemVolume> CVolumeManager::getVolumeOf(const P<IURI>& uri) {
    std::string path = tryToPath(uri);
    if (path.empty()) return nullptr;
    std::error_code error;
    std::string real = std::filesystem::weakly_canonical(std::filesystem::absolute(path), error).string();
    if (error) return nullptr;
    if (!real.ends_with('/')) real += '/';
    std::ifstream file(m_mountTable, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    // The longest matching mount point decides, even if it is not a volume: files on a virtual file system
    // that is mounted below the root are not on the root's volume.
    std::vector<SMount> mounts = parseMountTable(text.str());
    const SMount* best = nullptr;
    size_t bestLength = 0;
    for (const SMount& mount : mounts) {
        std::string folder = mount.mountPoint.ends_with('/') ? mount.mountPoint : mount.mountPoint + "/";
        if (folder.size() < bestLength || !real.starts_with(folder)) continue;
        best = &mount;
        bestLength = folder.size();
    }
    if (!best) return nullptr;
    for (const P<CFileSystemVolume>& volume : readVolumes())
        if (volume->getMount().device == best->device) return volume;
    return nullptr;
}

void CVolumeManager::addListener(IFileSystemVolumeListener* listener) {
    CMutexLock lock(m_mutex);
    if (!m_watch.watcher) {
        // Opened before the table is read, so that no change in between is missed.
        P<CMountWatcher> watcher = make<CMountWatcher>(this, m_mountTable);
        m_known = readVolumes();
        m_watch = {watcher, getThreadManager()->createThread(P<IAction>(watcher))};
    }
    m_listeners->add(listener);
}

void CVolumeManager::removeListener(IFileSystemVolumeListener* listener) {
    bool mayWait = false;
    {
        CMutexLock lock(m_mutex);
        m_listeners->remove(listener);
        if (m_listeners->getCount() == 0 && m_watch.watcher) {
            m_watch.watcher->stop();
            m_retired.push_back(m_watch);
            m_watch = SWatch();
        }
        // If listeners are being called, this is the thread that calls them, since it got the mutex.
        mayWait = !m_notifying;
    }
    if (mayWait) waitForRetired();
}

void CVolumeManager::waitForRetired() {
    std::vector<SWatch> retired;
    {
        CMutexLock lock(m_mutex);
        retired.swap(m_retired);
    }
    // Without the mutex, which the thread may be waiting for.
    for (const SWatch& watch : retired) watch.thread->wait();
}

void CVolumeManager::updateFrom(const CMountWatcher* watcher) {
    CMutexLock lock(m_mutex);
    if (m_watch.watcher.get() == watcher) update();
}

void CVolumeManager::update() {
    CMutexLock lock(m_mutex);
    CVolumes before = std::exchange(m_known, readVolumes());
    CVolumes now = m_known;
    auto contains = [](const CVolumes& volumes, const P<CFileSystemVolume>& wanted) {
        return std::any_of(volumes.begin(), volumes.end(),
                           [&](const P<CFileSystemVolume>& volume) { return isSame(volume, wanted); });
    };
    for (const P<CFileSystemVolume>& volume : before)
        if (!contains(now, volume)) notify(volume, &IFileSystemVolumeListener::volumeLeft);
    for (const P<CFileSystemVolume>& volume : now)
        if (!contains(before, volume)) notify(volume, &IFileSystemVolumeListener::volumeArrived);
}

void CVolumeManager::notify(const P<CFileSystemVolume>& volume,
                            void (IFileSystemVolumeListener::*event)(const P<IFileSystemVolume>&)) {
    m_notifying = true;
    // Over a copy, since a listener may remove itself or others during its call.
    std::vector<IFileSystemVolumeListener*> listeners;
    for (size_t i = m_listeners->getCount(); i-- > 0;) listeners.push_back(m_listeners->at(i));
    for (IFileSystemVolumeListener* listener : listeners) {
        if (!m_listeners->contains(listener)) continue;
        try {
            (listener->*event)(volume);
        } catch (...) {
            // A failing listener must not affect the others.
        }
    }
    m_notifying = false;
}

} // namespace peru::posix

namespace peru {

P<IVolumeManager> getVolumeManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IVolumeManager>(
        key, [] { return P<IVolumeManager>(make<posix::CVolumeManager>()); });
}

} // namespace peru
