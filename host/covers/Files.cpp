#include "Files.h"

#include "Failures.h"
#include "base/InputFile.h"
#include "base/Translation.h"
#include "peru/Errors.h"
#include "peru/streams/IStreamManager.h"
#include "peru/streams/StreamTools.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <stdexcept>

namespace host::covers {

namespace fs = std::filesystem;

namespace {

P<peru::IURI> toFileURI(const fs::path& file) {
    return peru::getPathes()->fromPlatformPath(fs::absolute(file).c_str());
}

} // namespace

P<ced::CProject> openProject(const fs::path& file, bool hasFileNames) {
    return ced::CProject::FromBytes(readFile(file), hasFileNames ? ced::CProject::EMode::fileNames
                                                                 : ced::CProject::EMode::embedded);
}

std::string readFile(const fs::path& file) {
    checkInput(file);
    return peru::readAll(*peru::getStreamManager()->getSeekableInStream(toFileURI(file)));
}

void requireFree(const fs::path& target, bool force, const fs::path& source) {
    if (isSameFile(source, target))
        throw std::runtime_error(tr("host.sameFile", "Input and output are the same file"));
    std::error_code none;
    if (!fs::exists(fs::symlink_status(target, none))) return;
    if (fs::is_directory(target, none))
        throw std::runtime_error(
            tr("host.Covers.folder", "%FILE% is a folder", {{"%FILE%", target.string()}}));
    if (!force)
        throw std::runtime_error(
            tr("host.existsForce", "%FILE% exists (--force replaces it)", {{"%FILE%", target.string()}}));
}

void writeFile(const fs::path& target, std::string_view bytes) {
    try {
        peru::getSystem()->replaceFile(toFileURI(target), bytes.data(), static_cast<int64_t>(bytes.size()));
    } catch (const peru::CException& error) {
        throw std::runtime_error(tr("host.Covers.write", "%FILE% could not be written: %REASON%",
                                    {{"%FILE%", target.string()}, {"%REASON%", getReason(error, target)}}));
    }
}

} // namespace host::covers
