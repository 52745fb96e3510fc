#include "sonora2/plugins/BuildId.h"

#include <cstring>
#include <fcntl.h>
#include <link.h>
#include <string_view>
#include <unistd.h>

namespace sonora2::common {

namespace {

// Linkers place headers and notes at the start of a file.
constexpr size_t kRead = 4096;

std::string readStart(const std::string& file) {
    std::string bytes(kRead, '\0');
    const int descriptor = ::open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (descriptor < 0) return {};
    const ssize_t size = ::read(descriptor, bytes.data(), bytes.size());
    ::close(descriptor);
    bytes.resize(size > 0 ? static_cast<size_t>(size) : 0);
    return bytes;
}

// False if the record does not lie within the bytes.
template <class Record> bool copyRecord(std::string_view bytes, size_t position, Record& record) {
    if (position > bytes.size() || bytes.size() - position < sizeof record) return false;
    std::memcpy(&record, bytes.data() + position, sizeof record);
    return true;
}

std::string toHex(std::string_view bytes) {
    constexpr const char* kDigits = "0123456789abcdef";
    std::string text;
    for (const char c : bytes) {
        text += kDigits[static_cast<unsigned char>(c) >> 4];
        text += kDigits[static_cast<unsigned char>(c) & 15];
    }
    return text;
}

std::string findBuildId(std::string_view notes, size_t alignment) {
    const auto align = [alignment](size_t size) { return (size + alignment - 1) / alignment * alignment; };
    constexpr std::string_view kOwner("GNU", 4); // with its zero
    ElfW(Nhdr) note;
    for (size_t position = 0; copyRecord(notes, position, note);) {
        const size_t name = position + sizeof note;
        const size_t description = name + align(note.n_namesz);
        if (description + note.n_descsz > notes.size()) break;
        if (note.n_type == NT_GNU_BUILD_ID && notes.substr(name, note.n_namesz) == kOwner)
            return toHex(notes.substr(description, note.n_descsz));
        position = description + align(note.n_descsz);
    }
    return {};
}

} // namespace

std::string getBuildId(const std::string& file) {
    const std::string start = readStart(file);
    const std::string_view bytes = start;
    ElfW(Ehdr) header;
    if (!copyRecord(bytes, 0, header) || std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 ||
        header.e_ident[EI_CLASS] != (sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32))
        return {};
    for (size_t i = 0; i < header.e_phnum; ++i) {
        ElfW(Phdr) segment;
        if (!copyRecord(bytes, header.e_phoff + i * sizeof segment, segment)) break;
        if (segment.p_type != PT_NOTE || segment.p_offset > bytes.size()) continue;
        const std::string id =
            findBuildId(bytes.substr(segment.p_offset, segment.p_filesz), segment.p_align == 8 ? 8 : 4);
        if (!id.empty()) return id;
    }
    return {};
}

} // namespace sonora2::common
