#include "peru/files/MountTable.h"

#include <algorithm>
#include <array>

namespace peru {
namespace {

std::vector<std::string_view> splitWords(std::string_view line) {
    std::vector<std::string_view> words;
    for (size_t start = 0; start < line.size();) {
        size_t end = std::min(line.find(' ', start), line.size());
        if (end > start) words.push_back(line.substr(start, end - start));
        start = end + 1;
    }
    return words;
}

bool isOctal(char ch) {
    return ch >= '0' && ch <= '7';
}

// White space and backslashes are written as a backslash and three octal digits.
std::string unescape(std::string_view word) {
    std::string result;
    for (size_t i = 0; i < word.size(); ++i) {
        bool code = word[i] == '\\' && i + 3 < word.size() && isOctal(word[i + 1]) && isOctal(word[i + 2]) &&
                    isOctal(word[i + 3]);
        if (!code) {
            result += word[i];
            continue;
        }
        result += static_cast<char>((word[i + 1] - '0') * 64 + (word[i + 2] - '0') * 8 + (word[i + 3] - '0'));
        i += 3;
    }
    return result;
}

bool hasOption(std::string_view options, std::string_view wanted) {
    for (size_t start = 0; start <= options.size();) {
        size_t end = std::min(options.find(',', start), options.size());
        if (options.substr(start, end - start) == wanted) return true;
        start = end + 1;
    }
    return false;
}

// File systems that hold users' files but have no block device of their own.
bool isNetworkOrLayered(const std::string& fileSystem) {
    static constexpr std::array<std::string_view, 13> kNames = {
        "nfs", "nfs4",    "cifs", "smb3", "smbfs",  "9p",      "virtiofs",
        "zfs", "overlay", "ceph", "afs",  "vboxsf", "bcachefs"};
    static constexpr std::array<std::string_view, 4> kHelpers = {"fuse.gvfsd-fuse", "fuse.portal",
                                                                 "fuse.lxcfs", "fuse.snapfuse"};
    if (fileSystem.starts_with("fuse."))
        return std::find(kHelpers.begin(), kHelpers.end(), fileSystem) == kHelpers.end();
    return std::find(kNames.begin(), kNames.end(), fileSystem) != kNames.end();
}

bool isVolume(const SMount& mount) {
    return mount.source.starts_with("/dev/") || isNetworkOrLayered(mount.fileSystem);
}

} // namespace

std::vector<SMount> parseMountTable(std::string_view text) {
    std::vector<SMount> mounts;
    for (size_t start = 0; start < text.size();) {
        size_t end = std::min(text.find('\n', start), text.size());
        std::vector<std::string_view> words = splitWords(text.substr(start, end - start));
        start = end + 1;
        // Six fixed words, any number of optional ones, "-", and three more.
        if (words.size() < 10) continue;
        auto dash = std::find(words.begin() + 6, words.end(), "-");
        if (words.end() - dash < 4) continue;
        bool readOnly = hasOption(words[5], "ro") || hasOption(dash[3], "ro");
        mounts.push_back({std::string(words[2]), unescape(words[3]), unescape(words[4]), unescape(dash[1]),
                          unescape(dash[2]), readOnly});
    }
    return mounts;
}

std::vector<SMount> selectVolumes(const std::vector<SMount>& mounts) {
    std::vector<SMount> volumes;
    for (auto mount = mounts.begin(); mount != mounts.end(); ++mount) {
        bool covered = std::any_of(mount + 1, mounts.end(), [&](const SMount& later) {
            return later.mountPoint == mount->mountPoint;
        });
        if (covered || !isVolume(*mount)) continue;
        auto same = std::find_if(volumes.begin(), volumes.end(),
                                 [&](const SMount& volume) { return volume.device == mount->device; });
        if (same == volumes.end())
            volumes.push_back(*mount);
        else if (same->root != "/" && mount->root == "/")
            *same = *mount; // prefer the whole file system to a part of it
    }
    return volumes;
}

} // namespace peru
