// Lists, extracts and adds the pictures in the tag of a sound file:
//
//     covers list FILE
//     covers extract FILE INDEX PICTURE
//     covers add FILE PICTURE
//
// Links only filetag and peru.
#include "filetag/FileTagFactory.h"
#include "filetag/ICoverArtFileTag.h"
#include "peru/Errors.h"
#include "peru/IInterfaceQuery.h"
#include "peru/system/IPathes.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

using filetag::ICoverArt;
using filetag::ICoverArtFileTag;
using peru::P;

namespace {

P<ICoverArtFileTag> openTag(const char* path) {
    const std::string absolute = std::filesystem::absolute(path); // tags need an absolute URI
    const P<peru::IURI> uri = peru::getPathes()->fromPlatformPath(peru::CString::fromUTF8(absolute));
    const P<filetag::IFileTag> tag = filetag::CFileTagFactory::get()->create(uri);
    // Every tag except that of a WAV file can hold pictures.
    const P<ICoverArtFileTag> pictures = peru::interfaceCast<ICoverArtFileTag>(tag);
    if (!pictures) throw peru::CFileFormatNotSupportedError(uri);
    return pictures;
}

void list(const P<ICoverArtFileTag>& tag) {
    for (int32_t i = 0; i < tag->getCoverArtCount(); ++i) {
        const P<ICoverArt> picture = tag->getCoverArt(i);
        std::printf("%d %s %s %lld\n", i,
                    picture->getPictureType() == filetag::kFrontCover ? "front" : "other",
                    peru::CString::toStdString(picture->getMimeType()).c_str(),
                    static_cast<long long>(picture->getData()->getSize()));
    }
}

bool extract(const P<ICoverArtFileTag>& tag, int32_t index, const char* path) {
    const P<ICoverArt> picture = tag->getCoverArt(index);
    if (!picture) return false;
    const P<peru::CMemoryBlock> data = picture->getData();
    std::ofstream file(path, std::ios::binary);
    file.write(reinterpret_cast<const char*>(data->getData()), data->getSize());
    file.close(); // flushes, so that good() covers every write
    return file.good();
}

bool add(const P<ICoverArtFileTag>& tag, const char* path) {
    std::ifstream file(path, std::ios::binary);
    const std::string bytes(std::istreambuf_iterator<char>(file), {});
    if (bytes.empty()) return false;
    const auto data = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::memcpy(data->getData(), bytes.data(), bytes.size());
    tag->addCoverArt(data, bytes.starts_with("\x89PNG") ? "image/png" : "image/jpeg", filetag::kFrontCover);
    tag->store(); // the file is unchanged until here
    return true;
}

bool run(int argc, char** argv) {
    const std::string command = argc > 2 ? argv[1] : "";
    if (command == "list" && argc == 3) {
        list(openTag(argv[2]));
        return true;
    }
    if (command == "extract" && argc == 5) return extract(openTag(argv[2]), std::atoi(argv[3]), argv[4]);
    if (command == "add" && argc == 4) return add(openTag(argv[2]), argv[3]);
    std::fprintf(stderr, "covers list FILE | extract FILE INDEX PICTURE | add FILE PICTURE\n");
    return false;
}

} // namespace

int main(int argc, char** argv) {
    try {
        return run(argc, argv) ? EXIT_SUCCESS : EXIT_FAILURE;
    } catch (const peru::CException& error) {
        std::fprintf(stderr, "covers: %s\n", peru::CString::toStdString(error.getDescription()).c_str());
        return EXIT_FAILURE;
    }
}
