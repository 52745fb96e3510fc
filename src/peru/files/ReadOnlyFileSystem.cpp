#include "peru/files/ReadOnlyFileSystem.h"

#include "peru/Errors.h"

namespace peru {

CReadOnlyFileSystem::~CReadOnlyFileSystem() = default;

void CReadOnlyFileSystem::refuse(const P<IURI>& uri) {
    throw CReadOnlyError(uri->getAsString());
}

void CReadOnlyFileSystem::setTimes(const P<IURI>& uri, const P<CFileTimes>& times) {
    refuse(uri);
}

void CReadOnlyFileSystem::createFolder(const P<IURI>& uri) {
    refuse(uri);
}

void CReadOnlyFileSystem::deleteFile(const P<IURI>& uri) {
    refuse(uri);
}

void CReadOnlyFileSystem::deleteEmptyFolder(const P<IURI>& uri) {
    refuse(uri);
}

void CReadOnlyFileSystem::deleteFolder(const P<IURI>& uri) {
    refuse(uri);
}

void CReadOnlyFileSystem::deleteUndoable(const P<IURI>& uri) {
    refuse(uri);
}

void CReadOnlyFileSystem::copyFile(const P<IURI>& source, const P<IURI>& destination) {
    refuse(destination);
}

void CReadOnlyFileSystem::copyLink(const P<IURI>& source, const P<IURI>& destination) {
    refuse(destination);
}

void CReadOnlyFileSystem::startFolder(const P<IURI>& source, const P<IURI>& destination) {
    refuse(destination);
}

void CReadOnlyFileSystem::finishFolder(const P<IURI>& source, const P<IURI>& destination) {
    refuse(destination);
}

bool CReadOnlyFileSystem::tryMove(const P<IURI>& source, const P<IURI>& destination) {
    refuse(source);
}

bool CReadOnlyFileSystem::isWithin(const P<IURI>& uri, const P<IURI>& folder) {
    std::string inner = CString::toStdString(uri->getAsString());
    std::string outer = CString::toStdString(folder->getAsString());
    if (!outer.ends_with('/')) outer += '/';
    return (inner + "/").starts_with(outer);
}

void CReadOnlyFileSystem::commit(const P<IURI>& uri) {
    // Nothing has been written.
}

} // namespace peru
