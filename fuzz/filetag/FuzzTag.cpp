// Treats arbitrary bytes as a file of one format: reading its tag must return texts and pictures or throw a
// CException, and fields that were set and stored must read back.
#include "filetag/FileTagFactory.h"
#include "filetag/ICoverArtFileTag.h"
#include "peru/Errors.h"
#include "peru/system/IPathes.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <unistd.h>

using namespace peru;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

// Stored in memory where possible, because the test is about tags and not about the disk.
class CFuzzedFile {
public:
    CFuzzedFile() {
        const std::filesystem::path memory = "/dev/shm";
        const auto parent =
            ::access(memory.c_str(), W_OK) == 0 ? memory : std::filesystem::temp_directory_path();
        std::string folder = (parent / "tonewright-fuzz-XXXXXX").string();
        require(::mkdtemp(folder.data()) != nullptr);
        m_folder = folder;
        m_uri = getPathes()->fromPlatformPath(CString::fromUTF8(getPath().string()));
    }
    ~CFuzzedFile() {
        std::error_code ignored;
        std::filesystem::remove_all(m_folder, ignored);
    }
    CFuzzedFile(const CFuzzedFile&) = delete;
    CFuzzedFile& operator=(const CFuzzedFile&) = delete;

    const P<IURI>& getURI() const { return m_uri; }
    void write(const uint8_t* data, size_t size) const {
        std::ofstream file(getPath(), std::ios::binary);
        file.write(reinterpret_cast<const char*>(data), static_cast<std::streamsize>(size));
    }

private:
    std::filesystem::path getPath() const { return m_folder / "fuzzed." FUZZED_EXTENSION; }

    std::filesystem::path m_folder;
    P<IURI> m_uri;
};

void readAll(const P<filetag::IFileTag>& tag) {
    tag->getTitle();
    tag->getArtist();
    tag->getAlbum();
    tag->getAlbumArtist();
    tag->getTrackNumber();
    tag->getYear();
    tag->getGenre();
    tag->getComment();
    tag->getTagType();
    const auto covers = tryCast<filetag::ICoverArtFileTag>(tag);
    if (!covers) return;
    const int32_t count = covers->getCoverArtCount();
    for (int32_t i = 0; i < count; ++i) {
        const P<filetag::ICoverArt> cover = covers->getCoverArt(i);
        if (!cover) continue;
        cover->getData();
        cover->getPictureType();
        cover->getMimeType();
        cover->getDescription();
    }
    require(!covers->getCoverArt(count));
}

// An ID3v1 tag is at the end of the file even if an earlier structure claims to extend into it. TagLib then
// overwrites one with the other, and which of them survives is unspecified.
bool hasOldTag(const uint8_t* data, size_t size) {
    constexpr size_t kOldTag = 128;
    return size >= kOldTag &&
           std::string_view(reinterpret_cast<const char*>(data) + size - kOldTag, 3) == "TAG";
}

void exercise(const P<IURI>& file, bool comesBack) {
    const P<filetag::CFileTagFactory> factory = make<filetag::CFileTagFactory>();
    const char16_t* const title = u"Titel \u00FC \u0416 \U0001F3B5";
    const P<filetag::IFileTag> tag = factory->create(file);
    readAll(tag);
    tag->setTitle(title);
    tag->setArtist("");
    tag->store();

    const P<filetag::IFileTag> again = factory->create(file);
    readAll(again);
    if (!comesBack) return;
    require(CString::toStdU16String(again->getTitle()) == title);
    require(again->getArtist()->isEmpty());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const CFuzzedFile file;
    file.write(data, size);
    try {
        exercise(file.getURI(), !hasOldTag(data, size));
    } catch (const CException&) {
    }
    return 0;
}
