// The entries of a ZIP archive.
#pragma once

#include "graphics/storage/LoadReports.h"
#include "graphics/storage/Reusables.h"

#include <memory>
#include <optional>
#include <set>

class wxZipEntry;
class wxZipInputStream;
class wxMemoryInputStream;

namespace graphics {

// Reads an archive that is in memory. Entries are only ever read by name, never extracted to files.
class GRAPHICS_API CZipCatalogue : public peru::CObject, public IResourceInputStore {
public:
    // Limits on what is unpacked, against archives that expand without end.
    static constexpr int64_t kMaximalEntry = 256 << 20;    // bytes
    static constexpr int64_t kMinimalTotal = 256 << 20;    // small archives may expand to this size,
    static constexpr int64_t kMaximalExpansion = 20;       // larger ones by this factor,
    static constexpr int64_t kMaximalTotal = 2048ll << 20; // but no archive further than this

    static int64_t GetInflatedLimit(int64_t archiveSize);

    // An archive that cannot be read has no entries.
    explicit CZipCatalogue(std::string archive);
    ~CZipCatalogue() override;
    CZipCatalogue(const CZipCatalogue&) = delete;
    CZipCatalogue& operator=(const CZipCatalogue&) = delete;

    P<CRichText> LoadRichText(const P<peru::IXmlNode>& node, const std::string& key) override;
    P<CBitmap> LoadBitmap(const P<peru::IXmlNode>& node, const std::string& key,
                          std::string& fileName) override;
    P<CBitmap> LoadBitmap(const P<peru::IXmlNode>& node, const std::string& key,
                          EBitmapFormat format) override;
    P<peru::IMemoryBlock> LoadMemory(const P<peru::IXmlNode>& node, const std::string& key) override;
    std::string LoadType(const P<peru::IXmlNode>& node) override;
    P<IReusableResource> LoadReusable(const P<peru::IXmlNode>& node, const std::string& type,
                                      const P<IReusableResource>& instance) override;
    void Report(const P<peru::IString>& text) override { m_reports.Add(text); }
    const std::vector<std::string>& GetReports() const override { return m_reports.Get(); }

    bool HasEntry(const std::string& name);
    // Throws CError, which names the entry, if it is missing, damaged or above a limit.
    std::string ReadEntry(const std::string& name, int64_t maximalSize = kMaximalEntry);
    // The picture of an entry; empty if it is missing or damaged.
    P<CBitmap> LoadBitmapEntry(const std::string& name, EBitmapFormat format);
    // Files that nobody has asked for, or that are no valid pictures, in the order of their names.
    std::vector<std::string> GetUnreadEntries();

private:
    void readCatalogue();
    // The bytes of an entry that is stored without compression, without the toolkit's stream, which copies
    // them three times; empty for other entries and for damaged ones.
    std::optional<std::string_view> findStored(const wxZipEntry& entry) const;
    // The name and the bytes of an attachment; empty if it is missing or damaged.
    bool readAttachment(const P<peru::IXmlNode>& node, const std::string& key, std::string& name,
                        std::string& bytes);

    const std::string m_archive;
    std::unique_ptr<wxMemoryInputStream> m_stream;
    std::unique_ptr<wxZipInputStream> m_zip;
    std::map<std::string, std::unique_ptr<wxZipEntry>> m_entries;
    std::set<std::string> m_readEntries;
    std::map<std::string, P<CBitmap>> m_bitmaps; // by entry, so that elements share them
    CLoadedResources m_resources;
    CLoadReports m_reports;
    int64_t m_total = 0; // bytes inflated
    const int64_t m_maximalTotal;
    int64_t m_stored = 0; // bytes copied from entries without compression, which may share their bytes
    const int64_t m_maximalStored;
    bool m_isRead = false;
};

} // namespace graphics
