#include "graphics/storage/ZipCatalogue.h"

#include "graphics/storage/BitmapFormats.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cstring>
#include <wx/log.h>
#include <wx/mstream.h>
#include <wx/zipstrm.h>
#include <zlib.h>

namespace graphics {

namespace {

[[noreturn]] void fail(const char* key, const char* text, const std::string& name) {
    throw peru::CError(peru::localize(key, text, {{"%NAME%", peru::CString::fromUTF8(name)}}));
}

} // namespace

CZipCatalogue::CZipCatalogue(std::string archive)
    : m_archive(std::move(archive)), m_maximalTotal(GetInflatedLimit(static_cast<int64_t>(m_archive.size()))),
      m_maximalStored(m_maximalTotal + static_cast<int64_t>(m_archive.size())) {}

int64_t CZipCatalogue::GetInflatedLimit(int64_t archiveSize) {
    return std::clamp(archiveSize * kMaximalExpansion, kMinimalTotal, kMaximalTotal);
}

CZipCatalogue::~CZipCatalogue() = default;

void CZipCatalogue::readCatalogue() {
    if (m_isRead) return;
    m_isRead = true;
    const wxLogNull quiet;
    m_stream = std::make_unique<wxMemoryInputStream>(m_archive.data(), m_archive.size());
    m_zip = std::make_unique<wxZipInputStream>(*m_stream, wxConvUTF8);
    while (auto entry = std::unique_ptr<wxZipEntry>(m_zip->GetNextEntry()))
        m_entries.emplace(entry->GetInternalName().utf8_string(), std::move(entry));
}

std::optional<std::string_view> CZipCatalogue::findStored(const wxZipEntry& entry) const {
    constexpr size_t kHeader = 30, kNameLength = 26, kExtraLength = 28;
    const std::string_view archive = m_archive;
    const auto offset = static_cast<size_t>(entry.GetOffset());
    const auto size = static_cast<size_t>(entry.GetSize());
    if (entry.GetMethod() != wxZIP_METHOD_STORE || (entry.GetFlags() & wxZIP_ENCRYPTED) != 0 ||
        entry.GetCompressedSize() != entry.GetSize() || offset > archive.size() ||
        archive.size() - offset < kHeader || !archive.substr(offset).starts_with("PK\3\4"))
        return std::nullopt;
    const auto readLength = [&](size_t at) -> size_t {
        return static_cast<uint8_t>(archive[offset + at]) | static_cast<uint8_t>(archive[offset + at + 1])
                                                                << 8;
    };
    const size_t begin = offset + kHeader + readLength(kNameLength) + readLength(kExtraLength);
    if (begin > archive.size() || size > archive.size() - begin) return std::nullopt;
    const std::string_view bytes = archive.substr(begin, size);
    const auto sum = crc32_z(0, reinterpret_cast<const Bytef*>(bytes.data()), bytes.size());
    return sum == entry.GetCrc() ? std::optional(bytes) : std::nullopt;
}

bool CZipCatalogue::HasEntry(const std::string& name) {
    readCatalogue();
    return m_entries.count(name) != 0;
}

std::string CZipCatalogue::ReadEntry(const std::string& name, int64_t maximalSize) {
    if (!HasEntry(name)) fail("graphics.CZipCatalogue.Missing", "The archive has no entry \"%NAME%\".", name);
    m_readEntries.insert(name);
    const wxLogNull quiet;
    const auto tooLarge = [&] {
        fail("graphics.CZipCatalogue.TooLarge", "The entry \"%NAME%\" of the archive is too large.", name);
    };
    const auto damaged = [&] {
        fail("graphics.CZipCatalogue.Damaged", "The entry \"%NAME%\" of the archive is damaged.", name);
    };
    if (const auto stored = findStored(*m_entries.at(name))) {
        const auto size = static_cast<int64_t>(stored->size());
        m_stored += size;
        if (size > maximalSize || m_stored > m_maximalStored) tooLarge();
        return std::string(*stored);
    }
    if (!m_zip->OpenEntry(*m_entries.at(name))) damaged();
    // In pieces: the size that the archive announces may be wrong.
    std::string bytes;
    bytes.reserve(static_cast<size_t>(std::clamp<int64_t>(m_entries.at(name)->GetSize(), 0, maximalSize)));
    std::vector<char> buffer(64 * 1024);
    for (;;) {
        m_zip->Read(buffer.data(), buffer.size());
        const size_t count = m_zip->LastRead();
        bytes.append(buffer.data(), count);
        m_total += static_cast<int64_t>(count);
        if (static_cast<int64_t>(bytes.size()) > maximalSize || m_total > m_maximalTotal) tooLarge();
        if (m_zip->Eof()) break;
        if (!m_zip->IsOk() || count == 0) damaged();
    }
    if (m_zip->GetLastError() == wxSTREAM_READ_ERROR) damaged();
    return bytes;
}

bool CZipCatalogue::readAttachment(const Node& node, const std::string& key, std::string& name,
                                   std::string& bytes) {
    const Node child = node->getChildNode(key.c_str());
    if (!child || !readAttribute(child, "name", name)) return false;
    try {
        bytes = ReadEntry(name);
        return true;
    } catch (const peru::CException& error) {
        reportAttachment(*this, name, error);
        return false;
    }
}

P<CRichText> CZipCatalogue::LoadRichText(const Node& node, const std::string& key) {
    std::string name, bytes;
    if (!readAttachment(node, key, name, bytes)) return {};
    return peru::make<CRichText>(std::move(bytes));
}

P<CBitmap> CZipCatalogue::LoadBitmap(const Node& node, const std::string& key, std::string& fileName) {
    const Node child = node->getChildNode(key.c_str());
    if (!child || !readAttribute(child, "name", fileName)) return {};
    return LoadBitmap(node, key, getFormatOfFile(fileName));
}

P<CBitmap> CZipCatalogue::LoadBitmap(const Node& node, const std::string& key, EBitmapFormat format) {
    const Node child = node->getChildNode(key.c_str());
    std::string name;
    if (!child || !readAttribute(child, "name", name)) return {};
    return LoadBitmapEntry(name, format);
}

P<CBitmap> CZipCatalogue::LoadBitmapEntry(const std::string& name, EBitmapFormat format) {
    if (const auto known = m_bitmaps.find(name); known != m_bitmaps.end()) return known->second;
    try {
        const auto bitmap = tryLoadBitmap(format, ReadEntry(name), name, *this);
        if (!bitmap) m_readEntries.erase(name); // nobody holds its bytes
        return m_bitmaps[name] = bitmap;
    } catch (const peru::CException& error) {
        reportAttachment(*this, name, error);
        return {};
    }
}

std::vector<std::string> CZipCatalogue::GetUnreadEntries() {
    readCatalogue();
    std::vector<std::string> names;
    for (const auto& [name, entry] : m_entries)
        if (!entry->IsDir() && m_readEntries.count(name) == 0) names.push_back(name);
    return names;
}

P<peru::IMemoryBlock> CZipCatalogue::LoadMemory(const Node& node, const std::string& key) {
    std::string name, bytes;
    if (!readAttachment(node, key, name, bytes)) return {};
    auto block = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::memcpy(block->getData(), bytes.data(), bytes.size());
    return block;
}

std::string CZipCatalogue::LoadType(const Node& node) {
    std::string type;
    readAttribute(node, "type", type);
    return type;
}

P<IReusableResource> CZipCatalogue::LoadReusable(const Node& node, const std::string& type,
                                                 const P<IReusableResource>& instance) {
    return m_resources.Load(node, type, instance, *this);
}

} // namespace graphics
