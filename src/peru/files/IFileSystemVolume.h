// Mounted volumes and notification about them.
#pragma once

#include "peru/uri/IURI.h"

#include <vector>

namespace peru {

class PERU_API IFileSystemVolume : public virtual IBase {
public:
    virtual P<IURI> getRoot() = 0;     // the folder where it is mounted
    virtual P<IString> getLabel() = 0; // its own label, otherwise the name of its folder; may be empty
    virtual P<IString> getFileSystemName() = 0; // such as "ext4"
    virtual bool isReadOnly() = 0;
    virtual bool isRemovable() = 0; // the medium can be ejected
    // Both query the system on every call. Throw CFileError if the volume does not respond.
    virtual int64_t getTotalBytes() = 0;
    virtual int64_t getFreeBytes() = 0; // available to this user
};

// Called on the volume manager's own thread, with its mutex held. A listener may call the volume manager,
// also to remove itself, but must not wait for another thread that adds or removes listeners.
class PERU_API IFileSystemVolumeListener : public virtual IBase {
public:
    virtual void volumeArrived(const P<IFileSystemVolume>& volume) = 0;
    virtual void volumeLeft(const P<IFileSystemVolume>& volume) = 0;
};

class PERU_API IVolumeManager : public virtual IBase {
public:
    // Volumes with user files; the kernel's virtual file systems are left out.
    virtual std::vector<P<IFileSystemVolume>> getVolumes() = 0;
    // The volume that contains the file; empty for other URIs and for files that are on no volume.
    virtual P<IFileSystemVolume> getVolumeOf(const P<IURI>& uri) = 0;
    // Listeners are not owned. removeListener waits for a call in progress, so that the listener is not
    // called after it has returned; if a listener removes itself during its own call, that call is the last.
    virtual void addListener(IFileSystemVolumeListener* listener) = 0;
    virtual void removeListener(IFileSystemVolumeListener* listener) = 0;
};

PERU_API P<IVolumeManager> getVolumeManager();

} // namespace peru
