#include "graphics/storage/DocumentArchive.h"

#include "peru/Errors.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/uri/IURI.h"
#include "peru/xml/XmlDocument.h"

#include <cstring>
#include <wx/log.h>
#include <wx/mstream.h>
#include <wx/zipstrm.h>

namespace graphics {

namespace {

constexpr int kCompressionLevel = 9;
// The tree of a document takes several times the memory of its text.
constexpr size_t kMaximalXml = 64 << 20; // bytes, without attachments
constexpr size_t kMaximalXmlWithAttachments = 1024 << 20;
constexpr int64_t kMaximalMarkup = 4'000'000; // tags and attributes

bool hasTooMuchMarkup(const std::string& xml) {
    return std::count_if(xml.begin(), xml.end(), [](char ch) { return ch == '<' || ch == '='; }) >
           kMaximalMarkup;
}

// Also when writing: a file that cannot be opened again would be a loss.
void checkLimits(const std::string& xml, size_t limit, const std::string& name) {
    if (xml.size() > limit || hasTooMuchMarkup(xml))
        throw peru::CError(peru::localize("graphics.DocumentArchive.TooLarge",
                                          "The XML \"%NAME%\" is too large.",
                                          {{"%NAME%", peru::CString::fromUTF8(name)}}));
}

P<peru::CXmlDocument> parse(const char* root, const std::string& bytes, size_t limit,
                            const std::string& name) {
    const auto fail = [&](const char* key, const char* text, const P<peru::IString>& details) {
        throw peru::CParseError(peru::localize(
            key, text,
            {{"%NAME%", peru::CString::fromUTF8(name)}, {"%ROOT%", root}, {"%DETAILS%", details}}));
    };
    checkLimits(bytes, limit, name);
    auto document = peru::make<peru::CXmlDocument>();
    try {
        const auto block = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
        std::memcpy(block->getData(), bytes.data(), bytes.size());
        document->parse(peru::make<peru::CMemoryIOStream>(block));
    } catch (const peru::CException& error) {
        fail("graphics.DocumentArchive.Damaged", "\"%NAME%\" could not be read: %DETAILS%",
             error.getDescription());
    }
    if (!document->getRootNode() || !document->getRootNode()->getName()->equals(root))
        fail("graphics.DocumentArchive.OtherRoot", "\"%NAME%\" has no element \"%ROOT%\".",
             peru::CString::empty());
    return document;
}

} // namespace

std::string WriteArchive(const SArchiveForm& form, const SaveContent& save, bool isLossless,
                         const std::vector<SArchiveEntry>& entries) {
    const wxLogNull quiet;
    wxMemoryOutputStream memory;
    {
        wxZipOutputStream archive(memory, kCompressionLevel, wxConvUTF8);
        const auto resources = peru::make<CZipResources>(archive);
        resources->SetLossless(isLossless);
        for (const SArchiveEntry& entry : entries) resources->WriteEntry(entry.name, entry.bytes);
        const auto document = peru::make<peru::CXmlDocument>();
        save(document->addChildNode(form.root), *resources);
        const std::string xml = peru::CString::toStdString(document->printToString());
        checkLimits(xml, kMaximalXml, form.entry);
        resources->WriteEntry(form.entry, xml);
        if (!archive.Close() || resources->GetDeflatedSize() >
                                    CZipCatalogue::GetInflatedLimit(static_cast<int64_t>(memory.GetSize())))
            throw peru::CError(
                peru::localize("graphics.DocumentArchive.NotWritten", "The archive could not be written."));
    }
    std::string bytes(memory.GetSize(), '\0');
    memory.CopyTo(bytes.data(), bytes.size());
    return bytes;
}

void ReadArchive(const SArchiveForm& form, std::string bytes, const LoadContent& load) {
    ReadArchive(form, *peru::make<CZipCatalogue>(std::move(bytes)), load);
}

void ReadArchive(const SArchiveForm& form, CZipCatalogue& catalogue, const LoadContent& load) {
    const auto document =
        parse(form.root, catalogue.ReadEntry(form.entry, kMaximalXml), kMaximalXml, form.entry);
    load(document->getRootNode(), catalogue);
}

std::string WriteXml(const char* root, const SaveContent& save, CBase64Resources::EMode mode) {
    const auto document = peru::make<peru::CXmlDocument>();
    const auto resources = peru::make<CBase64Resources>(mode);
    save(document->addChildNode(root), *resources);
    std::string xml = peru::CString::toStdString(document->printToString());
    checkLimits(xml, kMaximalXmlWithAttachments, "XML");
    return xml;
}

void ReadXml(const char* root, const std::string& bytes, const LoadContent& load,
             CBase64Resources::EMode mode) {
    const auto resources = peru::make<CBase64Resources>(mode);
    const auto document = parse(root, bytes, kMaximalXmlWithAttachments, "XML");
    load(document->getRootNode(), *resources);
}

} // namespace graphics
