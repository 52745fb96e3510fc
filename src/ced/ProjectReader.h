// Reads projects from files of all kinds.
#pragma once

#include "ced/Project.h"
#include "graphics/storage/ZipCatalogue.h"

namespace ced {

// One object reads one file. Throws CError.
class CProjectReader {
public:
    static P<CProject> Read(std::string bytes, CProject::EMode mode);

private:
    CProjectReader() = default;

    void ReadArchive(std::string bytes);
    void ReadXml(const std::string& bytes, CProject::EMode mode);
    bool ReadCoverPages(const P<graphics::CZipCatalogue>& catalogue);
    void KeepOtherEntries(graphics::CZipCatalogue& catalogue);

    const P<CProject> m_project = peru::make<CProject>();
};

} // namespace ced
