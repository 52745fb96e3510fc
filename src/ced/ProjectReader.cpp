#include "ced/ProjectReader.h"

#include "ced/GraphicTableContent.h"
#include "ced/ItemType.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/storage/BitmapFormats.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/streams/IStreamManager.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

namespace ced {

using graphics::Node;

namespace {

// Files are read into memory.
constexpr int64_t kMaximalFile = 4096ll << 20; // bytes

struct SKind {
    graphics::SArchiveForm form;
    EProjectFile kind;
};

constexpr SKind kKinds[] = {
    {graphics::kProjectForm, EProjectFile::project},
    {graphics::kTemplateForm, EProjectFile::designs},
    {graphics::kThemeForm, EProjectFile::theme},
    {graphics::kClipboardForm, EProjectFile::clipboard},
};

std::string readFile(const P<peru::IURI>& file) {
    const auto stream = peru::getStreamManager()->getSeekableInStream(file);
    if (stream->getSize() > kMaximalFile)
        throw peru::CFileError(peru::localize("ced.CProject.TooLarge", "The file is too large."), file);
    std::string bytes(static_cast<size_t>(stream->getSize()), '\0');
    stream->read(bytes.data(), static_cast<int64_t>(bytes.size()));
    return bytes;
}

// A name that leads out of a folder would be dangerous for whoever unpacks the archive.
bool isSafeName(const std::string& name) {
    return !name.starts_with('/') && name.find('\\') == std::string::npos &&
           ("/" + name + "/").find("/../") == std::string::npos;
}

// A design of one picture that fills the item.
P<CItem> makeCover(const P<graphics::CBitmap>& bitmap, graphics::SSize size) {
    const auto image = peru::make<graphics::CGraphicImage>();
    image->SetBitmap(bitmap);
    image->SetSize(size.width, size.height);
    image->SetTopLeft(0, 0);
    const auto document = peru::make<graphics::CGraphicDocument>();
    document->Add(image);
    document->SetContentBox(graphics::SRect{0, 0, size.width, size.height});
    return peru::make<CItem>(document);
}

} // namespace

P<CProject> CProjectReader::Read(std::string bytes, CProject::EMode mode) {
    CProjectReader reader;
    if (bytes.starts_with("PK"))
        reader.ReadArchive(std::move(bytes));
    else
        reader.ReadXml(bytes, mode);
    return reader.m_project;
}

void CProjectReader::ReadArchive(std::string bytes) {
    const auto catalogue = peru::make<graphics::CZipCatalogue>(std::move(bytes));
    for (const SKind& kind : kKinds) {
        if (!catalogue->HasEntry(kind.form.entry)) continue;
        m_project->m_kind = kind.kind;
        graphics::ReadArchive(kind.form, *catalogue,
                              [&](const Node& root, graphics::IResourceInputStore& store) {
                                  m_project->LoadContent(root, store);
                              });
        KeepOtherEntries(*catalogue);
        m_project->m_reports = catalogue->GetReports();
        return;
    }
    if (!ReadCoverPages(catalogue))
        throw peru::CError(peru::localize(
            "ced.CProject.NoMainEntry",
            "The archive is damaged, or has neither an entry \"%ENTRY%\" nor pictures of covers.",
            {{"%ENTRY%", graphics::kProjectForm.entry}}));
    m_project->m_reports = catalogue->GetReports();
}

void CProjectReader::ReadXml(const std::string& bytes, CProject::EMode mode) {
    m_project->m_kind = EProjectFile::exported;
    graphics::ReadXml(
        graphics::kProjectForm.root, bytes,
        [&](const Node& root, graphics::IResourceInputStore& store) {
            m_project->LoadContent(root, store);
            m_project->m_reports = store.GetReports();
        },
        mode);
}

bool CProjectReader::ReadCoverPages(const P<graphics::CZipCatalogue>& catalogue) {
    m_project->m_kind = EProjectFile::coverPages;
    bool isFound = false;
    for (int i = 0; i < kTargetTypeCount; ++i) {
        const auto target = static_cast<TargetType>(i);
        const auto document = peru::make<CDocument>();
        for (const ItemType type : getItemTypes(target)) {
            for (const bool isFolded : {false, true}) {
                if (isFolded && !isFoldable(type)) continue;
                const std::string entry = ItemTypeToXml(type) + (isFolded ? ",folded.jpg" : ".jpg");
                if (!catalogue->HasEntry(entry)) continue;
                isFound = true;
                if (const auto bitmap = catalogue->LoadBitmapEntry(entry, graphics::EBitmapFormat::jpg))
                    document->AddItem(makeCover(bitmap, getDefaultSize(type, isFolded)));
            }
        }
        if (!document->GetItems().empty()) m_project->SetTarget(target, document);
    }
    return isFound;
}

void CProjectReader::KeepOtherEntries(graphics::CZipCatalogue& catalogue) {
    for (const std::string& name : catalogue.GetUnreadEntries()) {
        try {
            if (!isSafeName(name))
                throw peru::CError(
                    peru::localize("ced.CProject.UnsafeName", "The name leads out of the archive."));
            m_project->m_entries.push_back({name, catalogue.ReadEntry(name)});
        } catch (const peru::CException& error) {
            graphics::reportAttachment(catalogue, name, error);
        }
    }
}

P<CProject> CProject::FromBytes(std::string bytes, EMode mode) {
    // Designs contain elements of this namespace.
    [[maybe_unused]] static const bool s_isRegistered =
        (graphics::setElementFactory(peru::make<CGraphicElementFactory>()), true);
    return CProjectReader::Read(std::move(bytes), mode);
}

P<CProject> CProject::Open(const P<peru::IURI>& file, EMode mode) {
    std::string bytes = readFile(file);
    try {
        return FromBytes(std::move(bytes), mode);
    } catch (const peru::CException& error) {
        throw peru::CFileError(
            peru::localize("ced.CProject.NotOpened", "'%FILE%' could not be opened: %DETAILS%",
                           {{"%FILE%", peru::getShownName(file)}, {"%DETAILS%", error.getDescription()}}),
            file);
    }
}

} // namespace ced
