#include "graphics/storage/Base64Resources.h"

#include "graphics/images/ImageCodec.h"
#include "graphics/storage/BitmapFormats.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <wx/base64.h>

namespace graphics {

namespace {

constexpr uintmax_t kMaximalFile = 256 << 20; // bytes

Node saveBytes(const Node& node, const std::string& key, const void* data, size_t size) {
    const Node child = addChild(node, key.c_str());
    std::string text(wxBase64EncodedSize(size), '\0');
    text.resize(wxBase64Encode(text.data(), text.size(), data, size));
    addChild(child, "base64")->setText(peru::CString::fromUTF8(text));
    return child;
}

// Empty if there is no such child, or if its text is damaged.
std::optional<std::string> loadBytes(const Node& node, const std::string& key, IResourceInputStore& store) {
    const Node child = node->getChildNode(key.c_str());
    const Node data = child ? child->getChildNode("base64") : Node();
    if (!data) return std::nullopt;
    const std::string text = peru::CString::toStdString(data->getText());
    std::string bytes(wxBase64DecodedSize(text.size()), '\0');
    const size_t size =
        wxBase64Decode(bytes.data(), bytes.size(), text.data(), text.size(), wxBase64DecodeMode_SkipWS);
    if (size == wxCONV_FAILED) {
        reportAttachment(store, key,
                         peru::CParseError(peru::localize("graphics.CBase64Resources.Damaged",
                                                          "The base64 text is damaged.")));
        return std::nullopt;
    }
    bytes.resize(size);
    return bytes;
}

std::string readFile(const std::string& fileName) {
    std::error_code error;
    const auto size = std::filesystem::file_size(fileName, error);
    if (error || size > kMaximalFile) return {};
    std::ifstream file(fileName, std::ios::binary);
    std::string bytes(size, '\0');
    file.read(bytes.data(), static_cast<std::streamsize>(size));
    bytes.resize(static_cast<size_t>(file.gcount()));
    return bytes;
}

// The format by the content, whatever the file's name is.
P<CBitmap> loadFile(const std::string& fileName) {
    const std::string bytes = fileName.empty() ? std::string() : readFile(fileName);
    if (bytes.empty()) return {};
    try {
        return peru::make<CBitmap>(detectFormat(bytes), bytes);
    } catch (const peru::CException&) {
        return {};
    }
}

} // namespace

void CBase64Resources::SaveRichText(const Node& node, const std::string& key, const P<CRichText>& text) {
    if (text) saveBytes(node, key, text->GetXml().data(), text->GetXml().size());
}

void CBase64Resources::SaveBitmap(const Node& node, const std::string& key, const P<CBitmap>& bitmap,
                                  const std::string& sourceFileName) {
    if (!bitmap) return;
    std::error_code error;
    if (m_mode == EMode::fileNames && std::filesystem::is_regular_file(sourceFileName, error)) return;
    const EBitmapFormat format = chooseFormat(*bitmap, {}, false);
    const std::string bytes = bitmap->Encode(format);
    writeAttribute(saveBytes(node, key, bytes.data(), bytes.size()), "extension", getExtension(format));
}

void CBase64Resources::SaveReusable(const Node& node, const std::string& type,
                                    const P<IReusableResource>& resource) {
    m_saved.Save(node, type, resource, *this);
}

void CBase64Resources::SaveMemory(const Node& node, const std::string& key,
                                  const P<peru::IMemoryBlock>& block) {
    if (block) saveBytes(node, key, block->getData(), static_cast<size_t>(block->getSize()));
}

P<CRichText> CBase64Resources::LoadRichText(const Node& node, const std::string& key) {
    auto bytes = loadBytes(node, key, *this);
    return bytes ? peru::make<CRichText>(std::move(*bytes)) : P<CRichText>();
}

P<CBitmap> CBase64Resources::LoadBitmap(const Node& node, const std::string& key, std::string& fileName) {
    if (m_mode == EMode::fileNames) {
        readAttribute(node, "filename", fileName);
        if (const auto bitmap = loadFile(fileName)) return bitmap;
    }
    std::string extension;
    if (const Node child = node->getChildNode(key.c_str())) {
        readAttribute(child, "extension", extension);
    } else {
        std::string source;
        if (readAttribute(node, "filename", source))
            Report(peru::localize("graphics.CBase64Resources.NotInFile",
                                  "The file does not contain the picture \"%NAME%\", but its name only.",
                                  {{"%NAME%", peru::CString::fromUTF8(source)}}));
        return {};
    }
    return LoadBitmap(node, key, getFormatOfFile("." + extension));
}

P<CBitmap> CBase64Resources::LoadBitmap(const Node& node, const std::string& key, EBitmapFormat format) {
    auto bytes = loadBytes(node, key, *this);
    return bytes ? tryLoadBitmap(format, std::move(*bytes), key, *this) : P<CBitmap>();
}

P<peru::IMemoryBlock> CBase64Resources::LoadMemory(const Node& node, const std::string& key) {
    const auto bytes = loadBytes(node, key, *this);
    if (!bytes) return {};
    auto block = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes->size()));
    std::memcpy(block->getData(), bytes->data(), bytes->size());
    return block;
}

std::string CBase64Resources::LoadType(const Node& node) {
    std::string type;
    readAttribute(node, "type", type);
    return type;
}

P<IReusableResource> CBase64Resources::LoadReusable(const Node& node, const std::string& type,
                                                    const P<IReusableResource>& instance) {
    return m_loaded.Load(node, type, instance, *this);
}

} // namespace graphics
