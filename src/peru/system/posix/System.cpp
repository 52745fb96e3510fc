#include "peru/system/posix/System.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/files/posix/FileOperations.h"
#include "peru/files/posix/FileReplacement.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"
#include "peru/system/posix/FileVersion.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <dlfcn.h>
#include <fcntl.h>
#include <link.h>
#include <memory>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace peru::posix {
namespace {

struct SLibraryCloser {
    void operator()(void* library) const { ::dlclose(library); }
};

std::string getAbsoluteVariable(const char* name) {
    const char* value = std::getenv(name);
    return value && value[0] == '/' ? value : "";
}

std::string getHomeFolder() {
    std::string home = getAbsoluteVariable("HOME");
    if (!home.empty()) return home;
    passwd entry;
    passwd* found = nullptr;
    std::string buffer(16384, '\0');
    ::getpwuid_r(::getuid(), &entry, buffer.data(), buffer.size(), &found);
    return found && found->pw_dir && found->pw_dir[0] == '/' ? found->pw_dir : "/";
}

std::string joinPath(std::string folder, const std::string& name) {
    if (!folder.ends_with('/')) folder += '/';
    return folder + name;
}

P<IURI> getUserFolder(const char* variable, const char* belowHome) {
    std::string folder = getAbsoluteVariable(variable);
    return toFolderURI(folder.empty() ? joinPath(getHomeFolder(), belowHome) : folder);
}

std::string getRealPath(const std::string& path) {
    std::unique_ptr<char, decltype(&std::free)> real(::realpath(path.c_str(), nullptr), &std::free);
    return real ? real.get() : "";
}

std::string getFolderOf(const std::string& file) {
    size_t slash = file.rfind('/');
    return slash == 0 || slash == std::string::npos ? "/" : file.substr(0, slash);
}

// The folder of libperu.so; empty if the loader does not know it.
std::string findLibraryFolder() {
    Dl_info info;
    if (!::dladdr(reinterpret_cast<void*>(&getSystem), &info) || !info.dli_fname) return "";
    std::string file = getRealPath(info.dli_fname);
    return file.empty() ? "" : getFolderOf(file);
}

// Found once: start-up asks for each plug-in.
const std::string& getLibraryFolder() {
    // Never destroyed: threads that outlive the singletons may ask.
    static const std::string& s_folder = *new std::string(findLibraryFolder());
    return s_folder;
}

// The library is in "lib", "lib64" or an architecture's folder below it; the parent folder is the prefix.
std::string getInstallationPrefix(const std::string& libraryFolder) {
    for (std::string folder = libraryFolder; folder != "/"; folder = getFolderOf(folder)) {
        std::string name = folder.substr(folder.rfind('/') + 1);
        if (name == "lib" || name == "lib64") return getFolderOf(folder);
    }
    return getFolderOf(libraryFolder);
}

// An empty handle means the temporary folder.
std::string getFolderPath(const P<IURI>& folder) {
    return toPath(folder ? folder : getSystem()->getTemporaryFolder());
}

} // namespace

P<IURI> CSystem::getMainExecutableFile() {
    std::string path(PATH_MAX, '\0');
    ssize_t length = ::readlink("/proc/self/exe", path.data(), path.size());
    if (length <= 0) return nullptr;
    path.resize(static_cast<size_t>(length));
    // The kernel marks a program file that was replaced while the program runs.
    static const std::string kDeleted = " (deleted)";
    if (path.ends_with(kDeleted) && ::access(path.c_str(), F_OK) != 0)
        path.resize(path.size() - kDeleted.size());
    return toURI(path);
}

P<IURI> CSystem::getProgramFileFolder() {
    P<IURI> file = getMainExecutableFile();
    return file ? toFolderURI(getFolderOf(toPath(file))) : nullptr;
}

P<IURI> CSystem::getDataFolder() {
    return getUserFolder("XDG_DATA_HOME", ".local/share");
}

P<IURI> CSystem::getConfigurationFolder() {
    return getUserFolder("XDG_CONFIG_HOME", ".config");
}

P<IURI> CSystem::getCacheFolder() {
    return getUserFolder("XDG_CACHE_HOME", ".cache");
}

P<IURI> CSystem::getTemporaryFolder() {
    std::string folder = getAbsoluteVariable("TMPDIR");
    return toFolderURI(folder.empty() ? "/tmp" : folder);
}

std::vector<P<IURI>> CSystem::getSearchFolders(const char* environmentVariable, const char* installed) {
    std::vector<std::string> folders;
    auto enter = [&folders](const std::string& folder) {
        std::string path = folder.ends_with('/') ? folder : folder + "/";
        if (path[0] == '/' && std::find(folders.begin(), folders.end(), path) == folders.end())
            folders.push_back(path);
    };
    const char* value = environmentVariable ? std::getenv(environmentVariable) : nullptr;
    std::string list = value ? value : "";
    for (size_t start = 0; start < list.size();) {
        size_t end = std::min(list.find(':', start), list.size());
        if (end > start) enter(list.substr(start, end - start));
        start = end + 1;
    }
    const std::string& libraryFolder = getLibraryFolder();
    if (!libraryFolder.empty()) {
        enter(libraryFolder);
        if (installed && *installed) enter(joinPath(getInstallationPrefix(libraryFolder), installed));
    }
    std::vector<P<IURI>> result;
    result.reserve(folders.size());
    for (const std::string& folder : folders) result.push_back(toFolderURI(folder));
    return result;
}

P<IURI> CSystem::createUniqueFile(const P<IURI>& folder, const CStringArg& prefix,
                                  const CStringArg& extension) {
    std::string suffix = CString::toStdString(extension);
    if (!suffix.empty() && !suffix.starts_with('.')) suffix.insert(0, ".");
    int error = 0;
    std::string path = createUnique(
        getFolderPath(folder), CString::toStdString(prefix), suffix, error, [](const std::string& file) {
            CFileHandle made(::open(file.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
            return made.isOpen() ? 0 : errno;
        });
    if (!path.empty()) return toURI(path);
    throw CFileError(localize("peru.CSystem.CreateUniqueFileFailed", "Error creating unique file name."),
                     folder);
}

P<IURI> CSystem::createUniqueFolder(const P<IURI>& folder, const CStringArg& prefix) {
    int error = 0;
    std::string path =
        createUnique(getFolderPath(folder), CString::toStdString(prefix), "", error,
                     [](const std::string& name) { return ::mkdir(name.c_str(), 0700) == 0 ? 0 : errno; });
    if (!path.empty()) return toFolderURI(path);
    throw CFileError(localize("peru.CSystem.CreateUniqueFolderFailed", "Error creating unique folder name."),
                     folder);
}

void CSystem::copyFile(const P<IURI>& source, const P<IURI>& destination) {
    int error = copyRegularFile(toPath(source), toPath(destination));
    if (error == 0) return;
    P<IString> from = getShownName(source);
    P<IString> to = getShownName(destination);
    if (error == EEXIST)
        throw CFileError(localize("peru.CSystem.CopyFile.Error.FileExists",
                                  "Error copying file '%SRC%' to '%DEST%'. The file already exists.",
                                  {{"%SRC%", from}, {"%DEST%", to}}),
                         destination);
    throw CFileError(localize("peru.CSystem.CopyFileFailed",
                              "Error copying file '%SRC%' to '%DEST%' (%MSG%).",
                              {{"%SRC%", from}, {"%DEST%", to}, {"%MSG%", getSystemText(error)}}),
                     source);
}

void CSystem::moveFile(const P<IURI>& source, const P<IURI>& destination) {
    if (renameWithoutReplacing(toPath(source), toPath(destination)) == 0) return;
    throw CFileError(localize("peru.CSystem.MoveFileFailed", "Error moving file '%SRC%' to '%DEST%'.",
                              {{"%SRC%", getShownName(source)}, {"%DEST%", getShownName(destination)}}),
                     source);
}

void CSystem::moveFolder(const P<IURI>& source, const P<IURI>& destination) {
    if (renameWithoutReplacing(toPath(source), toPath(destination)) == 0) return;
    throw CFileError(localize("peru.CSystem.MoveFolderFailed", "Error moving folder '%SRC%' to '%DEST%'.",
                              {{"%SRC%", getShownName(source)}, {"%DEST%", getShownName(destination)}}),
                     source);
}

P<IString> CSystem::getLibraryVersion(const CStringArg& libraryName) {
    std::string name = CString::toStdString(libraryName);
    if (name.empty()) return CString::empty();
    std::unique_ptr<void, SLibraryCloser> library(::dlopen(name.c_str(), RTLD_LAZY | RTLD_LOCAL));
    link_map* map = nullptr;
    if (!library || ::dlinfo(library.get(), RTLD_DI_LINKMAP, &map) != 0 || !map) return CString::empty();
    std::string file = getRealPath(map->l_name);
    if (file.empty()) return CString::empty();
    P<CFileVersion> version = CFileVersion::read(toURI(file));
    return version ? version->getVersion() : CString::empty();
}

void CSystem::replaceFile(const P<IURI>& file, const void* data, int64_t size) {
    const P<IFileReplacement> replacement = startReplacement(file);
    replacement->getStream()->write(data, size);
    replacement->commit();
}

P<IFileReplacement> CSystem::startReplacement(const P<IURI>& file) {
    return make<CFileReplacement>(file);
}

} // namespace peru::posix

namespace peru {

P<ISystem> getSystem() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<ISystem>(key, [] { return P<ISystem>(make<posix::CSystem>()); });
}

} // namespace peru
