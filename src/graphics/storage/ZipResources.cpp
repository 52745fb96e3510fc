#include "graphics/storage/ZipResources.h"

#include "graphics/storage/BitmapFormats.h"
#include "graphics/storage/XmlValues.h"
#include "graphics/storage/ZipCatalogue.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <wx/datetime.h>
#include <wx/zipstrm.h>

namespace graphics {

namespace {

bool isCompressed(EBitmapFormat format) {
    return format == EBitmapFormat::jpg || format == EBitmapFormat::jng || format == EBitmapFormat::png;
}

} // namespace

void CZipResources::WriteEntry(const std::string& name, std::string_view bytes) {
    m_names.insert(name);
    auto entry = std::make_unique<wxZipEntry>(wxString::FromUTF8(name), wxDateTime(1, wxDateTime::Jan, 1990));
    // Deflating a compressed picture again takes time and saves nothing.
    const bool isStored = isCompressed(getFormatOfFile(name));
    if (isStored) entry->SetMethod(wxZIP_METHOD_STORE);
    const auto size = static_cast<int64_t>(bytes.size());
    if (!isStored) m_deflatedSize += size;
    if (size <= CZipCatalogue::kMaximalEntry && m_archive.PutNextEntry(entry.release()) &&
        m_archive.WriteAll(bytes.data(), bytes.size()) && m_archive.CloseEntry())
        return;
    throw peru::CError(peru::localize("graphics.CZipResources.NotWritten",
                                      "The entry \"%NAME%\" could not be written to the archive.",
                                      {{"%NAME%", peru::CString::fromUTF8(name)}}));
}

std::string CZipResources::makeName(const char* word, const std::string& ending) {
    for (;;) {
        const std::string name = word + std::to_string(m_entryNumbers.GetNext()) + ending;
        if (m_names.count(name) == 0) return name;
    }
}

void CZipResources::SaveRichText(const Node& node, const std::string& key, const P<CRichText>& text) {
    if (!text) return;
    const std::string name = makeName("text", ".xml");
    WriteEntry(name, text->GetXml());
    writeAttribute(addChild(node, key.c_str()), "name", name);
}

void CZipResources::SaveBitmap(const Node& node, const std::string& key, const P<CBitmap>& bitmap,
                               const std::string& sourceFileName) {
    if (!bitmap) return;
    const EBitmapFormat format = chooseFormat(*bitmap, sourceFileName, m_isLossless);
    std::string& name = m_bitmapEntries[bitmap.get()];
    if (name.empty() || getFormatOfFile(name) != format) {
        const std::string bytes = bitmap->Encode(format);
        name = makeName("image", "." + getExtension(format));
        WriteEntry(name, bytes);
    }
    writeAttribute(addChild(node, key.c_str()), "name", name);
}

void CZipResources::SaveReusable(const Node& node, const std::string& type,
                                 const P<IReusableResource>& resource) {
    m_resources.Save(node, type, resource, *this);
}

void CZipResources::SaveMemory(const Node& node, const std::string& key, const P<peru::IMemoryBlock>& block) {
    if (!block) return;
    const std::string name = makeName("memory");
    WriteEntry(name,
               {reinterpret_cast<const char*>(block->getData()), static_cast<size_t>(block->getSize())});
    const Node child = addChild(node, key.c_str());
    writeAttribute(child, "name", name);
    writeInteger(child, "size", block->getSize());
}

} // namespace graphics
