// The volumes of this machine and notification of changes.
#pragma once

#include "peru/collections/FrailArray.h"
#include "peru/files/posix/FileSystemVolume.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/IThreadManager.h"

namespace peru::posix {

class CMountWatcher;

// While there are listeners, a thread waits for notifications from the kernel. The recursive mutex is held
// while listeners are called, so that removing one waits for a call in progress.
class PERU_API CVolumeManager : public CObject, public IVolumeManager {
public:
    explicit CVolumeManager(std::string mountTable = "/proc/self/mountinfo");
    ~CVolumeManager() override;

    std::vector<P<IFileSystemVolume>> getVolumes() override;
    P<IFileSystemVolume> getVolumeOf(const P<IURI>& uri) override;
    void addListener(IFileSystemVolumeListener* listener) override;
    void removeListener(IFileSystemVolumeListener* listener) override;

    // Compares the mount table with the state last reported and notifies listeners: removals first, then
    // arrivals.
    void update();

private:
    friend class CMountWatcher;
    using CVolumes = std::vector<P<CFileSystemVolume>>;
    struct SWatch {
        P<CMountWatcher> watcher;
        P<IThread> thread;
    };

    CVolumes readVolumes() const;
    void updateFrom(const CMountWatcher* watcher);
    void notify(const P<CFileSystemVolume>& volume,
                void (IFileSystemVolumeListener::*event)(const P<IFileSystemVolume>&));
    void waitForRetired();

    const std::string m_mountTable;
    P<IMutex> m_mutex; // guards everything below
    P<TFrailArray<IFileSystemVolumeListener>> m_listeners;
    CVolumes m_known; // the state last reported to listeners
    SWatch m_watch;   // empty if there are no listeners
    // Watches stopped from their own thread, which cannot wait for itself.
    std::vector<SWatch> m_retired;
    bool m_notifying = false;
};

} // namespace peru::posix
