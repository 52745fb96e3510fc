#include "freedb/FreeDBCache.h"

#include "peru/Errors.h"
#include "peru/files/IFileSystemManager.h"
#include "peru/log/ILog.h"
#include "peru/streams/IStreamManager.h"
#include "peru/streams/StreamTools.h"
#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"

#include <cstdio>
#include <string_view>

namespace freedb {

using peru::CString;

namespace {

constexpr std::string_view kMagic = "tonewright cddb 1\n";
constexpr int64_t kMostBytes = 64 << 20;

// FNV-1a.
uint64_t hash(std::string_view bytes) {
    uint64_t value = 0xcbf29ce484222325;
    for (const char c : bytes) value = (value ^ static_cast<unsigned char>(c)) * 0x100000001b3;
    return value;
}

std::string toHex(uint64_t number) {
    char digits[17];
    std::snprintf(digits, sizeof digits, "%016llx", static_cast<unsigned long long>(number));
    return digits;
}

// Neither part may contain a line end: both go into the head of the file.
std::string toKey(const std::string& server, const std::string& request) {
    return server + "\n" + request + "\n";
}

bool isLine(const std::string& text) {
    return text.find('\n') == std::string::npos;
}

} // namespace

CFreeDBCache::CFreeDBCache(const P<peru::IURI>& folder) : m_folder(folder) {}
CFreeDBCache::~CFreeDBCache() = default;

// Discs with different tracks may have the same id, so the name alone does not identify a request.
P<peru::IURI> CFreeDBCache::getFile(const std::string& name, const std::string& key) const {
    return m_folder->appendPath((name + "-" + toHex(hash(key))).c_str());
}

std::optional<SCachedReply> CFreeDBCache::find(const std::string& name, const std::string& server,
                                               const std::string& request) const {
    try {
        const std::string key = toKey(server, request);
        const P<peru::IURI> file = getFile(name, key);
        if (!peru::getFileSystemManager()->isFile(file) ||
            peru::getFileSystemManager()->getFileSize(file) > kMostBytes)
            return std::nullopt;
        const std::string bytes = peru::readAll(*peru::getStreamManager()->getInStream(file));
        const std::string head = std::string(kMagic) + key;
        const std::string_view check = std::string_view(bytes).substr(0, 17);
        if (bytes.size() < 17 || check != toHex(hash(std::string_view(bytes).substr(17))) + "\n" ||
            bytes.compare(17, head.size(), head) != 0)
            return std::nullopt;
        const size_t charset = 17 + head.size(), end = bytes.find('\n', charset);
        if (end == std::string::npos) return std::nullopt;
        return SCachedReply{bytes.substr(charset, end - charset), bytes.substr(end + 1)};
    } catch (const peru::CException& error) {
        peru::getLogManager()->debug(CString::fromUTF8("freedb"), error.getDescription());
        return std::nullopt;
    }
}

// The file begins with a checksum of all that follows it.
void CFreeDBCache::store(const std::string& name, const std::string& server, const std::string& request,
                         const SCachedReply& reply) const {
    if (!isLine(server) || !isLine(request) || !isLine(reply.charset)) return;
    try {
        const std::string key = toKey(server, request);
        const std::string content = std::string(kMagic) + key + reply.charset + "\n" + reply.text;
        const std::string bytes = toHex(hash(content)) + "\n" + content;
        peru::getFileSystemManager()->createFolder(m_folder);
        peru::getSystem()->replaceFile(getFile(name, key), bytes.data(), static_cast<int64_t>(bytes.size()));
    } catch (const peru::CException& error) {
        peru::getLogManager()->debug(CString::fromUTF8("freedb"), error.getDescription());
    }
}

} // namespace freedb
