#include "commands/TagCover.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ForEachFile.h"
#include "commands/Tag.h"
#include "media/Output.h"
#include "media/SoundFile.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cstdio>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int kFront = 3;
constexpr size_t kLargestPicture = 256 * 1024 * 1024; // no format holds more

// Without a type the front cover, or otherwise the first picture.
const STagPicture& choosePicture(const SWholeTag& tag, const std::optional<int>& type) {
    const auto found =
        std::find_if(tag.pictures.begin(), tag.pictures.end(),
                     [&](const STagPicture& picture) { return picture.type == type.value_or(kFront); });
    if (found != tag.pictures.end()) return *found;
    if (tag.pictures.empty()) throw std::runtime_error(tr("host.Cover.none", "Has no picture"));
    if (type)
        throw std::runtime_error(tr("host.Cover.noneOfType", "Has no picture of type %TYPE%",
                                    {{"%TYPE%", getPictureTypeName(*type)}}));
    return tag.pictures.front();
}

std::string readPicture(const fs::path& file) {
    checkInput(file);
    if (fs::file_size(file) > kLargestPicture)
        throw std::runtime_error(tr("host.Cover.tooLarge", "The picture is too large"));
    std::ifstream in(file, std::ios::binary);
    std::ostringstream bytes;
    bytes << in.rdbuf();
    if (!in) throw std::runtime_error(tr("host.unreadable", "The file cannot be read"));
    return bytes.str();
}

void writePicture(const fs::path& target, const STagPicture& picture, bool force) {
    COutput output(target, ".part", force);
    std::ofstream out(output.getTemporary(), std::ios::binary);
    out << picture.data << std::flush;
    if (!out)
        throw std::runtime_error(
            tr("host.unwritable", "%FILE% cannot be written", {{"%FILE%", target.native()}}));
    out.close();
    output.commit();
}

} // namespace

int showCovers(const SCoverOptions& options) {
    return forEachFile(options.files, options.json, EReader::needed, [&](const fs::path& file) {
        const SWholeTag tag = readWholeTag(file);
        if (options.json) {
            nlohmann::json line{{"file", file.native()}, {"pictures", nlohmann::json::array()}};
            for (const STagPicture& picture : tag.pictures) line["pictures"].push_back(toJson(picture));
            std::printf("%s\n", toLine(line).c_str());
            return;
        }
        std::printf("%s\n%s", toPrintable(file.native()).c_str(),
                    tag.pictures.empty() ? tr("host.Cover.noPictures", "  (none)\n").c_str() : "");
        for (const STagPicture& picture : tag.pictures)
            std::printf("  %s\n", toPrintable(describe(picture)).c_str());
    });
}

int exportCover(const SCoverOptions& options) {
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        const SWholeTag tag = readWholeTag(file);
        const STagPicture& picture = choosePicture(tag, options.type);
        writePicture(options.picture, picture, options.force);
        if (options.json)
            std::printf("%s\n", toLine({{"file", file.native()},
                                        {"output", options.picture.native()},
                                        {"picture", toJson(picture)}})
                                    .c_str());
        else
            std::printf("%s: %s\n", toPrintable(options.picture.native()).c_str(),
                        toPrintable(describe(picture)).c_str());
    });
}

int importCover(const SCoverOptions& options) {
    CTagChange change;
    try {
        STagPicture picture;
        picture.data = readPicture(options.picture);
        picture.type = options.type.value_or(kFront);
        change.removePictures(picture.type);
        change.addPicture(picture);
    } catch (const std::exception& error) {
        printFailure(options.picture, error.what());
        return kExitFailure;
    }
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        checkTagged(file);
        printChanged(file, change.apply(file), options.json);
    });
}

int removeCovers(const SCoverOptions& options) {
    CTagChange change;
    change.removePictures(options.type.value_or(-1));
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        checkTagged(file);
        printChanged(file, change.apply(file), options.json);
    });
}

} // namespace host
