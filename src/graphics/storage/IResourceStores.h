// Where documents put what is not text, and where they get it back from.
#pragma once

#include "graphics/elements/RichText.h"
#include "graphics/images/Bitmap.h"
#include "graphics/storage/IReusableResource.h"
#include "peru/MemoryManager.h"

#include <string>
#include <vector>

namespace graphics {

// A key becomes the name of a child of the node. Empty resources write nothing. Everything throws CError.
class GRAPHICS_API IResourceOutputStore : public virtual peru::IBase {
protected:
    ~IResourceOutputStore() override = default;

public:
    virtual void SaveRichText(const P<peru::IXmlNode>& node, const std::string& key,
                              const P<CRichText>& text) = 0;
    virtual void SaveBitmap(const P<peru::IXmlNode>& node, const std::string& key, const P<CBitmap>& bitmap,
                            const std::string& sourceFileName) = 0;
    // The first node of a resource holds its content; further ones refer to it. Throws CError if the resource
    // was saved with another type.
    virtual void SaveReusable(const P<peru::IXmlNode>& node, const std::string& type,
                              const P<IReusableResource>& resource) = 0;
    virtual void SaveMemory(const P<peru::IXmlNode>& node, const std::string& key,
                            const P<peru::IMemoryBlock>& block) = 0;
    // Lossless bitmaps are larger.
    virtual void SetLossless(bool isLossless) = 0;
    virtual bool IsLossless() const = 0;
};

// The result is empty if the attachment is missing or damaged.
class GRAPHICS_API IResourceInputStore : public virtual peru::IBase {
protected:
    ~IResourceInputStore() override = default;

public:
    virtual P<CRichText> LoadRichText(const P<peru::IXmlNode>& node, const std::string& key) = 0;
    // `fileName` receives where the bitmap came from: an entry of the archive or a file.
    virtual P<CBitmap> LoadBitmap(const P<peru::IXmlNode>& node, const std::string& key,
                                  std::string& fileName) = 0;
    // For attachments whose name does not tell the format.
    virtual P<CBitmap> LoadBitmap(const P<peru::IXmlNode>& node, const std::string& key,
                                  EBitmapFormat format) = 0;
    virtual P<peru::IMemoryBlock> LoadMemory(const P<peru::IXmlNode>& node, const std::string& key) = 0;
    virtual std::string LoadType(const P<peru::IXmlNode>& node) = 0;
    // The resource that was loaded before with the node's number, otherwise the instance, loaded from the
    // node. Throws CError if the types differ, or if a resource contains itself.
    virtual P<IReusableResource> LoadReusable(const P<peru::IXmlNode>& node, const std::string& type,
                                              const P<IReusableResource>& instance) = 0;
    // Logs and remembers what the reader leaves out, as a sentence for the user.
    virtual void Report(const P<peru::IString>& text) = 0;
    virtual const std::vector<std::string>& GetReports() const = 0;
};

} // namespace graphics
