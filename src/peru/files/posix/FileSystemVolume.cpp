#include "peru/files/posix/FileSystemVolume.h"

#include "peru/Errors.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <sys/stat.h>
#include <sys/statvfs.h>

namespace peru::posix {
namespace {

struct statvfs getStorageProperties(const SMount& mount) {
    struct statvfs status;
    if (::statvfs(mount.mountPoint.c_str(), &status) == 0) return status;
    int error = errno;
    P<IURI> uri = toFolderURI(mount.mountPoint);
    throw CFileError(localize("peru.CVolumeManager.GetStoragePropertiesFailed",
                              "Error getting the storage properties for drive letter '%DRIVE%' (%MSG%).",
                              {{"%DRIVE%", getShownName(uri)}, {"%MSG%", getSystemText(error)}}),
                     uri);
}

// Special characters in the names of device links are written as "\x" and two hexadecimal digits.
std::string unescapeLabel(const std::string& name) {
    std::string label;
    for (size_t i = 0; i < name.size(); ++i) {
        auto isHex = [&](size_t at) {
            return at < name.size() && std::isxdigit(static_cast<unsigned char>(name[at]));
        };
        if (name.compare(i, 2, "\\x") == 0 && isHex(i + 2) && isHex(i + 3)) {
            label += static_cast<char>(std::stoi(name.substr(i + 2, 2), nullptr, 16));
            i += 3;
        } else {
            label += name[i];
        }
    }
    return label;
}

std::string findDeviceLabel(const std::string& device) {
    struct stat wanted;
    if (::stat(device.c_str(), &wanted) != 0 || !S_ISBLK(wanted.st_mode)) return "";
    std::error_code error;
    std::filesystem::directory_iterator entry("/dev/disk/by-label", error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error)) {
        struct stat status;
        if (::stat(entry->path().c_str(), &status) == 0 && S_ISBLK(status.st_mode) &&
            status.st_rdev == wanted.st_rdev)
            return unescapeLabel(entry->path().filename().string());
    }
    return "";
}

} // namespace

P<IURI> CFileSystemVolume::getRoot() {
    return toFolderURI(m_mount.mountPoint);
}

P<IString> CFileSystemVolume::getLabel() {
    std::string label = findDeviceLabel(m_mount.source);
    if (label.empty()) label = m_mount.mountPoint.substr(m_mount.mountPoint.rfind('/') + 1);
    return CString::fromUTF8(label);
}

P<IString> CFileSystemVolume::getFileSystemName() {
    return CString::fromUTF8(m_mount.fileSystem);
}

bool CFileSystemVolume::isRemovable() {
    std::error_code error;
    std::filesystem::path device = std::filesystem::canonical("/sys/dev/block/" + m_mount.device, error);
    if (error) return false;
    // A partition's folder is inside its disk's, which has the attribute.
    for (const std::filesystem::path& folder : {device, device.parent_path()}) {
        int removable = 0;
        if (std::ifstream(folder / "removable") >> removable) return removable != 0;
    }
    return false;
}

int64_t CFileSystemVolume::getTotalBytes() {
    struct statvfs status = getStorageProperties(m_mount);
    return static_cast<int64_t>(status.f_blocks) * static_cast<int64_t>(status.f_frsize);
}

int64_t CFileSystemVolume::getFreeBytes() {
    struct statvfs status = getStorageProperties(m_mount);
    return static_cast<int64_t>(status.f_bavail) * static_cast<int64_t>(status.f_frsize);
}

P<IString> CFileSystemVolume::getSource() {
    return CString::fromUTF8(m_mount.source);
}

P<IString> CFileSystemVolume::getDeviceNumber() {
    return CString::fromUTF8(m_mount.device);
}

} // namespace peru::posix
