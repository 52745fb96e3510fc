// One mounted volume of this machine.
#pragma once

#include "peru/Object.h"
#include "peru/files/IFileSystemVolume.h"
#include "peru/files/MountTable.h"

namespace peru::posix {

// Platform-specific additions to IFileSystemVolume.
class PERU_API IPosixFileSystemVolume : public virtual IFileSystemVolume {
public:
    virtual P<IString> getSource() = 0;       // the device file or network share
    virtual P<IString> getDeviceNumber() = 0; // "major:minor"
};

// Immutable; thread-safe.
class CFileSystemVolume : public CObject, public IPosixFileSystemVolume {
public:
    explicit CFileSystemVolume(SMount mount) : m_mount(std::move(mount)) {}

    P<IURI> getRoot() override;
    P<IString> getLabel() override;
    P<IString> getFileSystemName() override;
    bool isReadOnly() override { return m_mount.readOnly; }
    bool isRemovable() override;
    int64_t getTotalBytes() override;
    int64_t getFreeBytes() override;
    P<IString> getSource() override;
    P<IString> getDeviceNumber() override;

    const SMount& getMount() const { return m_mount; }

private:
    SMount m_mount;
};

} // namespace peru::posix
