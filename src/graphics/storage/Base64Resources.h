// Attachments inside the XML.
#pragma once

#include "graphics/storage/LoadReports.h"
#include "graphics/storage/Reusables.h"

namespace graphics {

// For exported documents and snapshots. One object either saves or loads one document.
class GRAPHICS_API CBase64Resources : public peru::CObject,
                                      public IResourceOutputStore,
                                      public IResourceInputStore {
public:
    enum class EMode {
        embedded,
        fileNames, // bitmaps whose file exists are not written, and are read from it
    };

    explicit CBase64Resources(EMode mode = EMode::embedded) : m_mode(mode) {}
    ~CBase64Resources() override = default;

    void SaveRichText(const P<peru::IXmlNode>& node, const std::string& key,
                      const P<CRichText>& text) override;
    void SaveBitmap(const P<peru::IXmlNode>& node, const std::string& key, const P<CBitmap>& bitmap,
                    const std::string& sourceFileName) override;
    void SaveReusable(const P<peru::IXmlNode>& node, const std::string& type,
                      const P<IReusableResource>& resource) override;
    void SaveMemory(const P<peru::IXmlNode>& node, const std::string& key,
                    const P<peru::IMemoryBlock>& block) override;
    // Has no effect: bitmaps are JPEG, or JNG with transparency.
    void SetLossless(bool isLossless) override { m_isLossless = isLossless; }
    bool IsLossless() const override { return m_isLossless; }

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

private:
    const EMode m_mode;
    bool m_isLossless = false;
    CSavedResources m_saved;
    CLoadedResources m_loaded;
    CLoadReports m_reports;
};

} // namespace graphics
