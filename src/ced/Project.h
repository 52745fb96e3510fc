// A project: content, formats and the designs of its targets.
#pragma once

#include "ced/Document.h"
#include "ced/TargetType.h"
#include "graphics/storage/Base64Resources.h"
#include "graphics/storage/DocumentArchive.h"
#include "peru/uri/IURI.h"

#include <array>

namespace ced {

enum class EProjectFile {
    project,    // *.cedprj
    exported,   // *.xml
    designs,    // *.cedtpl: designs for targets
    theme,      // *.cedtheme
    coverPages, // *.cedcovers: a picture for each item
    clipboard,  // what the clipboard holds, if it was stored as a file
};

// Interface thread only. What this version does not know, also of files from later versions, is carried
// along: content, formats, further targets, attributes, elements next to the known ones and entries of the
// archive.
class GRAPHICS_API CProject : public peru::CObject {
public:
    static constexpr int kVersion = 2;
    using EMode = graphics::CBase64Resources::EMode;

    CProject() = default;
    ~CProject() override = default;

    // Detects the kind of the file by its content. The mode matters for exported projects only. Throws
    // CFileError, which names the file and the entry or element.
    static P<CProject> Open(const P<peru::IURI>& file, EMode mode = EMode::embedded);
    // The same from memory. Throws CError.
    static P<CProject> FromBytes(std::string bytes, EMode mode = EMode::embedded);

    // Each writes a whole new file before it replaces an existing one, whose mode and links it preserves.
    // Lossless archives have PNG pictures and are larger. Throws CError or CFileError; the old file is then
    // unchanged.
    void Save(const P<peru::IURI>& file, bool isLossless = false) const;
    void Export(const P<peru::IURI>& file, EMode mode = EMode::embedded) const;
    std::string ToArchive(bool isLossless = false) const;
    std::string ToXml(EMode mode = EMode::embedded) const;

    EProjectFile GetFileKind() const { return m_kind; }
    // Of the root element; kVersion for new projects and cover pages. A later version is preserved.
    int64_t GetVersion() const { return m_version; }
    bool IsFromLaterVersion() const;
    // What could not be read and was left out, each also a warning in the log.
    const std::vector<std::string>& GetReports() const { return m_reports; }

    // The program that wrote the file.
    const std::string& GetCreator() const { return m_creator; }
    void SetCreator(const std::string& creator) { m_creator = creator; }
    bool HasCutMarks() const { return m_hasCutMarks; }
    void SetCutMarks(bool hasCutMarks) { m_hasCutMarks = hasCutMarks; }
    bool IsColoured() const { return m_isColoured; }
    void SetColoured(bool isColoured) { m_isColoured = isColoured; }

    // Empty if there is no design for the target.
    const P<CDocument>& GetTarget(TargetType type) const;
    void SetTarget(TargetType type, const P<CDocument>& document);
    // Designs for targets that this version does not know, each with the name of its element.
    const std::vector<std::pair<std::string, P<CDocument>>>& GetOtherTargets() const {
        return m_otherTargets;
    }
    // All of them, first the known targets.
    std::vector<std::pair<std::string, P<CDocument>>> GetDocuments() const;

    // The elements "format" and "content" as they were read. Empty if there is none.
    const SXmlFragment* FindFormat(const std::string& id) const;
    const std::vector<SXmlFragment>& GetFormats() const { return m_formats.children; }
    void AddFormat(SXmlFragment format) { m_formats.children.push_back(std::move(format)); }
    const SXmlFragment& GetContent() const { return m_content; }
    void SetContent(SXmlFragment content) { m_content = std::move(content); }

private:
    friend class CProjectReader;

    void SaveContent(const P<peru::IXmlNode>& root, graphics::IResourceOutputStore& store) const;
    void LoadContent(const P<peru::IXmlNode>& root, graphics::IResourceInputStore& store);

    EProjectFile m_kind = EProjectFile::project;
    int64_t m_version = kVersion;
    std::string m_creator = "Tonewright";
    bool m_hasCutMarks = false;
    bool m_isColoured = true;
    SXmlFragment m_content;
    SXmlFragment m_formats;
    std::array<P<CDocument>, kTargetTypeCount> m_targets;
    std::vector<std::pair<std::string, P<CDocument>>> m_otherTargets;
    SXmlFragment m_others;
    std::vector<graphics::SArchiveEntry> m_entries; // that nothing in the project refers to
    std::vector<std::string> m_reports;
};

} // namespace ced
