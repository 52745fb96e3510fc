#include "projects/VirtualDataDisc.h"

#include <algorithm>
#include <cerrno>
#include <ctime>
#include <fcntl.h>
#include <string_view>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace discio {

namespace {

constexpr size_t kMaxNameBytes = 255;
constexpr size_t kMaxTitleBytes = 32;     // of a volume descriptor
constexpr size_t kMaxDepth = 127;         // nobody nests that deep, and the tree is walked recursively
constexpr int64_t kMaxBlocks = 1LL << 31; // the block numbers of the file system, with some to spare

int64_t toBlocks(int64_t bytes) {
    return (bytes + kDataSectorBytes - 1) / kDataSectorBytes;
}

bool isControl(char c) {
    return (c >= 0 && c < 0x20) || c == 0x7F;
}

void checkName(const std::string& name) {
    const auto refuse = [&](const char* reason) {
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "\"" + name + "\" " + reason);
    };
    if (name.empty() || name == "." || name == "..") refuse("is not a name");
    if (name.size() > kMaxNameBytes) refuse("is longer than 255 bytes");
    if (std::any_of(name.begin(), name.end(), isControl)) refuse("has a control character");
}

int64_t countBlocks(const CVirtualDataDisc::SNode& node) {
    int64_t blocks = toBlocks(node.entry.size);
    for (const auto& [name, child] : node.children) blocks += countBlocks(*child);
    return blocks;
}

SDataEntry describeSource(const std::string& path) {
    const auto refuse = [&](int32_t code) {
        throw CDiscError(code, path + ": " + std::generic_category().message(errno));
    };
    struct statx status {};
    if (::statx(AT_FDCWD, path.c_str(), 0, STATX_BASIC_STATS | STATX_BTIME, &status) != 0)
        refuse(errno == ENOENT || errno == ENOTDIR ? DISCIO_ERROR_NOT_FOUND : DISCIO_ERROR_READ_INPUT);
    if (!S_ISREG(status.stx_mode)) throw CDiscError(DISCIO_ERROR_NOT_A_FILE, path + " is not a regular file");
    if (::access(path.c_str(), R_OK) != 0) refuse(DISCIO_ERROR_READ_INPUT);
    SDataEntry entry;
    entry.source = path;
    entry.size = static_cast<int64_t>(status.stx_size);
    entry.modified = status.stx_mtime.tv_sec;
    entry.accessed = status.stx_atime.tv_sec;
    if (status.stx_mask & STATX_BTIME) entry.created = status.stx_btime.tv_sec;
    return entry;
}

} // namespace

CVirtualDataDisc::CVirtualDataDisc() {
    m_root.entry.isFolder = true;
    STrack track;
    track.number = 1;
    track.pregap = kLeadInSectors;
    m_contents.tracks.push_back(track);
}

SMediumState CVirtualDataDisc::getState() const {
    SMediumState state;
    state.type = EMediumType::none;
    state.isEmpty = m_root.children.empty();
    state.isWritable = true;
    state.capacityBytes = m_blocks * kDataSectorBytes;
    return state;
}

std::unique_ptr<IAudioReader> CVirtualDataDisc::createAudioReader(const STrack&) const {
    throw CDiscError(DISCIO_ERROR_NO_AUDIO, "");
}

std::string CVirtualDataDisc::getDataPath() const {
    throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "a project has no file system yet");
}

CVirtualDataDisc::SNode& CVirtualDataDisc::requireFolder(const DataPath& folder) {
    SNode* node = &m_root;
    for (const std::string& name : folder) {
        const auto found = node->children.find(name);
        if (found == node->children.end()) throw CDiscError(DISCIO_ERROR_NOT_FOUND, name + " does not exist");
        node = found->second.get();
        if (!node->entry.isFolder) throw CDiscError(DISCIO_ERROR_NOT_A_FOLDER, name + " is not a folder");
    }
    return *node;
}

std::vector<SDataEntry> CVirtualDataDisc::list(const DataPath& folder) {
    std::vector<SDataEntry> entries;
    for (const auto& [name, child] : requireFolder(folder).children) entries.push_back(child->entry);
    return entries;
}

std::optional<SDataEntry> CVirtualDataDisc::find(const DataPath& folder, const std::string& name) {
    const SNode& node = requireFolder(folder);
    const auto found = node.children.find(name);
    if (found == node.children.end()) return std::nullopt;
    return found->second->entry;
}

CVirtualDataDisc::SNode& CVirtualDataDisc::requireParent(const std::string& path, std::string& name) {
    DataPath names;
    for (size_t i = 0; i < path.size();) {
        const size_t end = std::min(path.find_first_of("\\/", i), path.size());
        if (end > i) names.push_back(path.substr(i, end - i));
        i = end + 1;
    }
    if (names.empty())
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "\"" + path + "\" is not the path of an entry");
    if (names.size() > kMaxDepth) throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, path + " is too deep");
    name = names.back();
    names.pop_back();
    return requireFolder(names);
}

void CVirtualDataDisc::add(const std::string& path, SDataEntry entry) {
    std::string name;
    SNode& parent = requireParent(path, name);
    checkName(name);
    if (parent.children.contains(name)) throw CDiscError(DISCIO_ERROR_ALREADY_EXISTS, path);
    const int64_t blocks = m_blocks + toBlocks(entry.size);
    if (blocks > kMaxBlocks) throw CDiscError(DISCIO_ERROR_NOT_ENOUGH_SPACE, path);
    auto node = std::make_unique<SNode>();
    node->entry = std::move(entry);
    node->entry.name = node->entry.stored = name;
    parent.children.emplace(name, std::move(node));
    m_blocks = blocks;
    m_contents.leadOut = m_contents.tracks[0].length =
        static_cast<int32_t>(std::min<int64_t>(m_blocks, INT32_MAX));
}

void CVirtualDataDisc::setTitle(const std::string& title) {
    requireIdle();
    if (title.size() > kMaxTitleBytes)
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "\"" + title + "\" is longer than 32 bytes");
    if (std::any_of(title.begin(), title.end(), isControl))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "\"" + title + "\" has a control character");
    m_title = title;
}

void CVirtualDataDisc::addFile(const std::string& path, const std::string& source) {
    requireIdle();
    add(path, describeSource(source));
}

void CVirtualDataDisc::createFolder(const std::string& path) {
    requireIdle();
    SDataEntry entry;
    entry.isFolder = true;
    entry.created = entry.modified = entry.accessed = std::time(nullptr);
    add(path, std::move(entry));
}

void CVirtualDataDisc::remove(const std::string& path) {
    requireIdle();
    std::string name;
    SNode& parent = requireParent(path, name);
    const auto found = parent.children.find(name);
    if (found == parent.children.end()) throw CDiscError(DISCIO_ERROR_NOT_FOUND, path + " does not exist");
    m_blocks -= countBlocks(*found->second);
    parent.children.erase(found);
    m_contents.leadOut = m_contents.tracks[0].length =
        static_cast<int32_t>(std::min<int64_t>(m_blocks, INT32_MAX));
}

} // namespace discio
