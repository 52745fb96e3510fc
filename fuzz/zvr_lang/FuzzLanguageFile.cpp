// Arbitrary bytes as a language file: it is read, or refused with an error of the family.
#include "peru/log/ILog.h"
#include "peru/system/IPathes.h"
#include "zvr_lang_manager/LanguageFile.h"

#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

using namespace zvr_lang;

namespace {

// In memory, since a disk would be the slowest part.
std::string makeFile() {
    std::string name = "/dev/shm/tonewright-fuzz-XXXXXX";
    const int file = ::mkstemp(name.data());
    if (file < 0) std::abort();
    ::close(file);
    return name;
}

const struct SFile {
    std::string name = makeFile();
    ~SFile() { ::unlink(name.c_str()); }
} kFile;

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FILE* file = std::fopen(kFile.name.c_str(), "wb");
    if (!file || std::fwrite(data, 1, size, file) != size) std::abort();
    std::fclose(file);
    try {
        const auto uri = peru::getPathes()->fromPlatformPath(kFile.name.c_str());
        const peru::P<CLanguageFile> opened = CLanguageFile::open(uri);
        if (!opened->getLanguageId().valid) std::abort();
        CLanguageEntries entries;
        opened->load(entries, "peru");
        size_t bytes = 0;
        entries.forEach([&](const SLanguageEntry& entry) {
            if (entries.find(*entry.key) != &entry) std::abort();
            bytes += static_cast<size_t>(entry.text->getLength());
        });
        if (bytes > size) std::abort();
    } catch (const peru::CException&) {
    }
    return 0;
}
