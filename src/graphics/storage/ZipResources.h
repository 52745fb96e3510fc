// Attachments in a ZIP archive that is being written.
#pragma once

#include "graphics/storage/Reusables.h"

#include <set>

class wxZipOutputStream;

namespace graphics {

// Does not own the archive. Throws CError if the archive cannot take an entry.
class GRAPHICS_API CZipResources : public peru::CObject, public IResourceOutputStore {
public:
    explicit CZipResources(wxZipOutputStream& archive) : m_archive(archive) {}
    ~CZipResources() override = default;

    void SaveRichText(const P<peru::IXmlNode>& node, const std::string& key,
                      const P<CRichText>& text) override;
    void SaveBitmap(const P<peru::IXmlNode>& node, const std::string& key, const P<CBitmap>& bitmap,
                    const std::string& sourceFileName) override;
    void SaveReusable(const P<peru::IXmlNode>& node, const std::string& type,
                      const P<IReusableResource>& resource) override;
    void SaveMemory(const P<peru::IXmlNode>& node, const std::string& key,
                    const P<peru::IMemoryBlock>& block) override;
    void SetLossless(bool isLossless) override { m_isLossless = isLossless; }
    bool IsLossless() const override { return m_isLossless; }

    // With a fixed date: the same content gives the same archive.
    // Throws CError above the size that can be read.
    void WriteEntry(const std::string& name, std::string_view bytes);
    // The bytes of all entries that were compressed.
    int64_t GetDeflatedSize() const { return m_deflatedSize; }

private:
    // An unused name: the word, a number and the ending.
    std::string makeName(const char* word, const std::string& ending = {});

    wxZipOutputStream& m_archive;
    CIdGenerator m_entryNumbers;
    std::set<std::string> m_names;
    CSavedResources m_resources;
    std::map<const CBitmap*, std::string>
        m_bitmapEntries; // so that elements that share a bitmap share its entry
    int64_t m_deflatedSize = 0;
    bool m_isLossless = false;
};

} // namespace graphics
