#include "disciopp/DataDiscProject.h"

#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "peru/Errors.h"

namespace disciopp {

using peru::CString;

namespace {

// A path is returned without the "\" at its start, whether or not it was given relative to the disc.
std::u16string toPath(const P<peru::IURI>& uri, const P<peru::IURI>& root) {
    std::u16string path = CString::toStdU16String(toDiscPath(uri, root));
    if (path.starts_with(u'\\')) path.erase(0, 1);
    return path;
}

void require(int32_t result) {
    if (result != 1) throw CDISCIOPPException();
}

// Tests each part of the path and creates those that are missing.
void createPath(DISCIO_Disc* disc, const std::u16string& path) {
    for (size_t end = 0; end < path.size();) {
        end = std::min(path.find(u'\\', end + 1), path.size());
        const std::u16string part = path.substr(0, end);
        if (part.ends_with(u'\\')) continue; // an empty name
        if (DISCIO_DiscDataFolderExistsW(disc, part.c_str()) != 1)
            require(DISCIO_DiscDataCreateFolderW(disc, part.c_str()));
    }
}

} // namespace

CDataDiscProject::CDataDiscProject()
    : CProjectBase(Handle<DISCIO_Project>(DISCIO_CreateDataDiscProject(getDiscio())), kVirtualDataScheme),
      m_files(m_disc ? m_disc->getFileSystem() : nullptr) {
    if (!m_files) throw peru::CError("The disc of the project is not a data disc");
}

CDataDiscProject::~CDataDiscProject() = default;

void CDataDiscProject::addFile(const P<peru::IURI>& source, const P<peru::IURI>& target, bool createFolders) {
    const std::u16string path = toPath(target, m_root);
    const size_t name = path.rfind(u'\\');
    if (createFolders && name != std::u16string::npos) createPath(getHandle(), path.substr(0, name));
    // The source's path may contain "\" here, so it stays a URI.
    const std::u16string from = CString::toStdU16String(source->getAsString());
    require(DISCIO_DiscDataAddFileW(getHandle(), path.c_str(), from.c_str()));
}

void CDataDiscProject::createFolders(const P<peru::IURI>& folder) {
    createPath(getHandle(), toPath(folder, m_root));
}

void CDataDiscProject::createFolder(const P<peru::IURI>& uri) {
    require(DISCIO_DiscDataCreateFolderW(getHandle(), toPath(uri, m_root).c_str()));
}

} // namespace disciopp
