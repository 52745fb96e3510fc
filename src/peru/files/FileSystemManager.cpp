#include "peru/files/FileSystemManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/streams/IStreamManager.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <memory>
#include <utility>

namespace peru {
namespace {

constexpr int64_t kCopyBufferSize = 256 * 1024;

[[noreturn]] void throwRouteError(const char* key, const char* text, const P<IURI>& source,
                                  const P<IURI>& destination, const P<IURI>& culprit) {
    throw CFileError(
        localize(key, text, {{"%SRC%", getShownName(source)}, {"%DEST%", getShownName(destination)}}),
        culprit);
}

// Removes what a failed operation has created. Its own failure is ignored, as it would hide the first error.
void removeQuietly(const P<IFileSystem>& fileSystem, const P<IURI>& uri,
                   void (IFileSystem::*remove)(const P<IURI>&)) {
    try {
        (fileSystem.get()->*remove)(uri);
    } catch (const CException&) {
    }
}

// False if it cannot be determined, as that error would hide the first one.
bool isFolderQuietly(const P<IFileSystem>& fileSystem, const P<IURI>& uri) {
    try {
        P<IFileObject> object = fileSystem->getFileObject(uri);
        return object && object->isFolder();
    } catch (const CException&) {
        return false;
    }
}

// The file that the error refers to, otherwise the operation's own.
P<IURI> getCulprit(const CException& error, const P<IURI>& otherwise) {
    auto* uriError = dynamic_cast<const CURIError*>(&error);
    return uriError && uriError->getURI() ? uriError->getURI() : otherwise;
}

// Copies between two different file systems.
void copyThroughStreams(const P<IURI>& source, const P<IURI>& destination, const P<IFileSystem>& to,
                        const P<CFileTimes>& times) {
    P<IInStream> in = getStreamManager()->getInStream(source);
    // If this fails, the destination is not ours and must not be deleted below.
    P<IOutStream> out = getStreamManager()->getOutStream(destination, EOpenMode::createNew);
    try {
        auto buffer = std::make_unique<uint8_t[]>(kCopyBufferSize);
        while (int64_t count = in->readSome(buffer.get(), kCopyBufferSize)) out->write(buffer.get(), count);
        out->close();
        to->setTimes(destination, times);
    } catch (...) {
        removeQuietly(to, destination, &IFileSystem::deleteFile);
        throw;
    }
}

} // namespace

CFileSystemManager::CFileSystemManager() : m_mutex(getMutexFactory()->createMutex()) {
    // No lock needed: no other thread knows this object yet, and the global object factory's mutex is held.
    m_mounts.push_back({CString::empty(), createDiskFileSystem()});
}

CFileSystemManager::~CFileSystemManager() = default;

// --- Look-up ---

void CFileSystemManager::mount(const P<IFileSystem>& fileSystem) {
    mountScheme("", fileSystem);
}

void CFileSystemManager::mountScheme(const CStringArg& scheme, const P<IFileSystem>& fileSystem) {
    SMount entry{CString::fromUTF8(CString::toStdString(scheme)), fileSystem};
    CMutexLock lock(m_mutex);
    m_mounts.insert(m_mounts.begin(), std::move(entry));
}

void CFileSystemManager::unmount(const P<IFileSystem>& fileSystem) {
    CMutexLock lock(m_mutex);
    std::erase_if(m_mounts, [&](const SMount& entry) { return entry.fileSystem == fileSystem; });
}

P<IFileSystem> CFileSystemManager::getFileSystem(const P<IURI>& uri) {
    if (!uri) return nullptr;
    P<IString> scheme = uri->getScheme();
    std::vector<SMount> mounts; // asked without the mutex, since file systems may call anything
    {
        CMutexLock lock(m_mutex);
        mounts = m_mounts;
    }
    for (const SMount& entry : mounts) {
        bool handled =
            entry.scheme->isEmpty() ? entry.fileSystem->handles(uri) : entry.scheme->equalsIgnoreCase(scheme);
        if (handled) return entry.fileSystem;
    }
    return nullptr;
}

P<IFileSystem> CFileSystemManager::requireFileSystem(const P<IURI>& uri) {
    P<IFileSystem> fileSystem = getFileSystem(uri);
    if (!fileSystem) throw CURITypeNotSupportedError(uri);
    return fileSystem;
}

P<IFileObject> CFileSystemManager::getFileObject(const P<IURI>& uri) {
    P<IFileSystem> fileSystem = getFileSystem(uri);
    return fileSystem ? fileSystem->getFileObject(uri) : nullptr;
}

P<IFileObject> CFileSystemManager::requireFileObject(const P<IURI>& uri) {
    P<IFileObject> object = requireFileSystem(uri)->getFileObject(uri);
    if (!object) throw CFileNotFoundError(uri);
    return object;
}

bool CFileSystemManager::exists(const P<IURI>& uri) {
    return static_cast<bool>(getFileObject(uri));
}

bool CFileSystemManager::isFile(const P<IURI>& uri) {
    P<IFileObject> object = getFileObject(uri);
    return object && object->isFile();
}

bool CFileSystemManager::isFolder(const P<IURI>& uri) {
    P<IFileObject> object = getFileObject(uri);
    return object && object->isFolder();
}

int64_t CFileSystemManager::getFileSize(const P<IURI>& uri) {
    return requireFileObject(uri)->getSize();
}

P<CFileTimes> CFileSystemManager::getTimes(const P<IURI>& uri) {
    return requireFileObject(uri)->getTimes();
}

SFileAttributes CFileSystemManager::getAttributes(const P<IURI>& uri) {
    return requireFileObject(uri)->getAttributes();
}

P<IFileObjectCursor> CFileSystemManager::enumerate(const P<IURI>& folder) {
    return requireFileObject(folder)->enumerate();
}

// --- Changes ---

void CFileSystemManager::setTimes(const P<IURI>& uri, const P<CFileTimes>& times) {
    requireFileSystem(uri)->setTimes(uri, times);
}

void CFileSystemManager::createFolder(const P<IURI>& uri) {
    P<IFileSystem> fileSystem = requireFileSystem(uri);
    std::vector<P<IURI>> missing; // innermost first
    for (P<IURI> folder = uri; folder && !folder->getPath()->isEmpty(); folder = folder->getParent()) {
        if (isFolder(folder)) break;
        missing.push_back(folder);
    }
    std::vector<P<IURI>> made;
    try {
        for (; !missing.empty(); missing.pop_back()) {
            try {
                fileSystem->createFolder(missing.back());
                made.push_back(missing.back());
            } catch (const CException&) {
                // Another process may have created it in the meantime.
                if (!isFolderQuietly(fileSystem, missing.back())) throw;
            }
        }
    } catch (...) {
        for (; !made.empty(); made.pop_back())
            removeQuietly(fileSystem, made.back(), &IFileSystem::deleteEmptyFolder);
        throw;
    }
}

void CFileSystemManager::deleteFile(const P<IURI>& uri) {
    requireFileSystem(uri)->deleteFile(uri);
}

void CFileSystemManager::deleteFolder(const P<IURI>& uri) {
    requireFileSystem(uri)->deleteFolder(uri);
}

void CFileSystemManager::deleteUndoable(const P<IURI>& uri) {
    requireFileSystem(uri)->deleteUndoable(uri);
}

// --- Copying ---

CFileSystemManager::SRoute CFileSystemManager::makeRoute(const P<IURI>& source, const P<IURI>& destination) {
    return {source, destination, requireFileSystem(source), requireFileSystem(destination)};
}

void CFileSystemManager::copy(const P<IURI>& source, const P<IURI>& destination) {
    SRoute route = makeRoute(source, destination);
    P<IFileObject> object = requireFileObject(source);
    if (exists(destination))
        throwRouteError("peru.CFileSystemManager.CopyFile.Error.FileExists",
                        "Error copying file '%SRC%' to '%DEST%'. The file already exists.", source,
                        destination, destination);
    if (object->isFolder() && route.from == route.to && route.to->isWithin(destination, source))
        throwRouteError(
            "peru.CFileSystemManager.CopyFolder.Error.WithinItself",
            "Error copying folder '%SRC%' to '%DEST%'. The destination lies in the folder itself.", source,
            destination, destination);
    copyObject(route, object, false);
}

void CFileSystemManager::copyObject(const SRoute& route, const P<IFileObject>& object, bool keepLink) {
    bool within = route.from == route.to;
    if (within && keepLink && object->getAttributes().link) {
        route.to->copyLink(route.source, route.destination);
    } else if (object->isFolder()) {
        copyFolder(route, object);
    } else if (within) {
        route.to->copyFile(route.source, route.destination);
    } else {
        if (route.to->getFileObject(route.destination))
            throwRouteError("peru.CFileSystemManager.CopyFile.Error.FileExists",
                            "Error copying file '%SRC%' to '%DEST%'. The file already exists.", route.source,
                            route.destination, route.destination);
        copyThroughStreams(route.source, route.destination, route.to, object->getTimes());
    }
}

void CFileSystemManager::copyFolder(const SRoute& route, const P<IFileObject>& folder) {
    if (route.from == route.to)
        route.to->startFolder(route.source, route.destination);
    else
        route.to->createFolder(route.destination);
    try {
        fillFolder(route, folder);
    } catch (...) {
        removeQuietly(route.to, route.destination, &IFileSystem::deleteFolder);
        throw;
    }
}

void CFileSystemManager::fillFolder(const SRoute& route, const P<IFileObject>& folder) {
    P<IFileObjectCursor> cursor = folder->enumerate();
    while (cursor->next()) {
        P<IFileObject> child = cursor->getFileObject();
        P<IURI> destination = route.destination->appendPath(child->getName());
        // A disc image may hold any name, such as "../x", which would lead out of the folder.
        P<IURI> parent = destination->getParent();
        if (!parent || !parent->equals(route.destination->appendPath("/")))
            throw CFileError(localize("peru.CSystem.CopyFileFailed",
                                      "Error copying file '%SRC%' to '%DEST%' (%MSG%).",
                                      {{"%SRC%", getShownName(route.source)},
                                       {"%DEST%", getShownName(destination)},
                                       {"%MSG%", child->getName()}}),
                             route.source);
        copyObject({child->getURI(), destination, route.from, route.to}, child, true);
    }
    if (route.from == route.to)
        route.to->finishFolder(route.source, route.destination);
    else
        route.to->setTimes(route.destination, folder->getTimes());
}

// --- Moving ---

void CFileSystemManager::move(const P<IURI>& source, const P<IURI>& destination) {
    SRoute route = makeRoute(source, destination);
    P<IFileObject> object = requireFileObject(source);
    if (object->isFolder() && !object->getAttributes().link)
        moveFolder(route, object);
    else
        moveFile(route, object);
}

void CFileSystemManager::moveFile(const SRoute& route, const P<IFileObject>& object) {
    if (route.from == route.to && route.from->tryMove(route.source, route.destination)) return;
    copyObject(route, object, true);
    try {
        route.to->commit(route.destination);
        route.from->deleteFile(route.source);
    } catch (...) {
        removeQuietly(route.to, route.destination, &IFileSystem::deleteFile);
        throw;
    }
}

void CFileSystemManager::moveFolder(const SRoute& route, const P<IFileObject>& folder) {
    auto failToCreate = [&route] {
        throwRouteError("peru.CFileSystemManager.MoveFolderFailed.CreateFolder",
                        "Error moving folder '%SRC%' to '%DEST%'. Could not create the folder.", route.source,
                        route.destination, route.destination);
    };
    auto fail = [&route](const CException& error) {
        throwRouteError("peru.CFileSystemManager.MoveFolderFailed",
                        "Error moving folder '%SRC%' to '%DEST%'.", route.source, route.destination,
                        getCulprit(error, route.source));
    };
    if (exists(route.destination))
        throwRouteError("peru.CFileSystemManager.MoveFolderFailed.FolderExists",
                        "Error moving folder '%SRC%' to '%DEST%'. The folder already exists.", route.source,
                        route.destination, route.destination);
    P<IURI> parent = route.destination->getParent();
    if (parent && !parent->getPath()->isEmpty() && !isFolder(parent)) failToCreate();
    bool within = route.from == route.to;
    try {
        if (within && route.from->tryMove(route.source, route.destination)) return;
        if (within && route.to->isWithin(route.destination, route.source))
            throw CFileError("", route.destination);
    } catch (const CException& error) {
        fail(error);
    }
    try {
        if (within)
            route.to->startFolder(route.source, route.destination);
        else
            route.to->createFolder(route.destination);
    } catch (const CException&) {
        failToCreate();
    }
    try {
        try {
            fillFolder(route, folder);
            route.to->commit(route.destination);
        } catch (...) {
            removeQuietly(route.to, route.destination, &IFileSystem::deleteFolder);
            throw;
        }
        // From here on the copy must stay: parts of the source may be gone.
        route.from->deleteFolder(route.source);
    } catch (const CException& error) {
        fail(error);
    }
}

P<IFileSystemManager> getFileSystemManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IFileSystemManager>(
        key, [] { return P<IFileSystemManager>(make<CFileSystemManager>()); });
}

} // namespace peru
