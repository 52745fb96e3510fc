#include "peru/system/posix/FileVersion.h"

#include "peru/posix/PlatformFile.h"
#include "peru/strings/String.h"

#include <climits>
#include <cstdlib>
#include <cstring>
#include <elf.h>
#include <fcntl.h>
#include <link.h>
#include <optional>
#include <unistd.h>
#include <vector>

namespace peru::posix {
namespace {

using SHeader = ElfW(Ehdr);
using SSegment = ElfW(Phdr);
using SEntry = ElfW(Dyn);

constexpr unsigned char kClass = sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32;
// More than any linker writes; a file that claims more is not a valid library.
constexpr uint64_t kMaxDynamicSize = 1024 * 1024;
constexpr size_t kMaxName = 4096;

bool readAt(int file, uint64_t offset, void* buffer, size_t size) {
    return offset <= INT64_MAX &&
           ::pread(file, buffer, size, static_cast<off_t>(offset)) == static_cast<ssize_t>(size);
}

// Converts an address of the loaded library to an offset in the file.
std::optional<uint64_t> toFileOffset(const std::vector<SSegment>& segments, uint64_t address) {
    for (const SSegment& segment : segments) {
        if (segment.p_type != PT_LOAD || address < segment.p_vaddr) continue;
        uint64_t distance = address - segment.p_vaddr;
        if (distance < segment.p_filesz) return segment.p_offset + distance;
    }
    return std::nullopt;
}

// False if the file is not a shared library. The name stays empty if the library has none.
bool readSoname(int file, std::string& soname) {
    SHeader header;
    if (!readAt(file, 0, &header, sizeof header)) return false;
    if (std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 || header.e_ident[EI_CLASS] != kClass) return false;
    if (header.e_type != ET_DYN || header.e_phentsize != sizeof(SSegment)) return false;
    std::vector<SSegment> segments(header.e_phnum);
    if (!readAt(file, header.e_phoff, segments.data(), segments.size() * sizeof(SSegment))) return false;
    for (const SSegment& segment : segments) {
        if (segment.p_type != PT_DYNAMIC || segment.p_filesz > kMaxDynamicSize) continue;
        std::vector<SEntry> entries(segment.p_filesz / sizeof(SEntry));
        if (!readAt(file, segment.p_offset, entries.data(), entries.size() * sizeof(SEntry))) return false;
        std::optional<uint64_t> name;
        uint64_t names = 0;
        for (const SEntry& entry : entries) {
            if (entry.d_tag == DT_NULL) break;
            if (entry.d_tag == DT_SONAME) name = entry.d_un.d_val;
            if (entry.d_tag == DT_STRTAB) names = entry.d_un.d_ptr;
        }
        if (!name) return true;
        std::optional<uint64_t> start = toFileOffset(segments, names + *name);
        char buffer[kMaxName];
        if (!start || *start > INT64_MAX) return false;
        ssize_t count = ::pread(file, buffer, sizeof buffer, static_cast<off_t>(*start));
        if (count <= 0) return false;
        soname.assign(buffer, ::strnlen(buffer, static_cast<size_t>(count)));
        return true;
    }
    return false;
}

std::string getVersionOf(const std::string& name) {
    size_t mark = name.rfind(".so.");
    return mark == std::string::npos ? "" : name.substr(mark + 4);
}

} // namespace

P<CFileVersion> CFileVersion::read(const P<IURI>& file) {
    std::string path = tryToPath(file);
    char* real = path.empty() ? nullptr : ::realpath(path.c_str(), nullptr);
    if (!real) return nullptr;
    path = real;
    std::free(real);
    CFileHandle handle(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    std::string soname;
    if (!handle.isOpen() || !readSoname(handle.get(), soname)) return nullptr;
    std::string version = getVersionOf(path.substr(path.rfind('/') + 1));
    if (version.empty()) version = getVersionOf(soname);
    return make<CFileVersion>(CString::fromUTF8(soname), CString::fromUTF8(version));
}

} // namespace peru::posix
