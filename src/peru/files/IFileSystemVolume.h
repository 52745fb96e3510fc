// Mounted volumes and who wants to know of them.
#pragma once

#include "peru/uri/IURI.h"

#include <vector>

namespace peru {

class PERU_API IFileSystemVolume : public virtual IBase {
public:
    virtual P<IURI> getRoot() = 0;              // the folder where it is mounted
    virtual P<IString> getLabel() = 0;          // its own name, else that of its folder; may be empty
    virtual P<IString> getFileSystemName() = 0; // such as "ext4"
    virtual bool isReadOnly() = 0;
    virtual bool isRemovable() = 0; // the medium can be taken out
    // Both ask the system each time. Throw CFileError when the volume does not answer.
    virtual int64_t getTotalBytes() = 0;
    virtual int64_t getFreeBytes() = 0; // that this user may fill
};

// Comes on the volume manager's own thread.
class PERU_API IFileSystemVolumeListener : public virtual IBase {
public:
    virtual void volumeArrived(const P<IFileSystemVolume>& volume) = 0;
    virtual void volumeLeft(const P<IFileSystemVolume>& volume) = 0;
};

class PERU_API IVolumeManager : public virtual IBase {
public:
    // Those with files of their own; the file systems of the kernel's making are left out.
    virtual std::vector<P<IFileSystemVolume>> getVolumes() = 0;
    // The volume that holds the file; empty for other URIs and for what lies on no volume.
    virtual P<IFileSystemVolume> getVolumeOf(const P<IURI>& uri) = 0;
    // Listeners are held without a reference. After remove has returned none is told anything more, and a
    // call that was on its way has ended, unless the listener removes itself out of it.
    virtual void addListener(IFileSystemVolumeListener* listener) = 0;
    virtual void removeListener(IFileSystemVolumeListener* listener) = 0;
};

PERU_API P<IVolumeManager> getVolumeManager();

} // namespace peru
