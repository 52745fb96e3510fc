// What the text forms of images share.
#include "ImageLayout.h"

#include <algorithm>
#include <cctype>
#include <filesystem>

namespace discio {

namespace fs = std::filesystem;

namespace {

bool isUTF8(std::string_view text) {
    for (size_t i = 0; i < text.size();) {
        const auto lead = static_cast<uint8_t>(text[i]);
        const size_t length = lead < 0x80                   ? 1
                              : lead >= 0xC2 && lead < 0xE0 ? 2
                              : lead >= 0xE0 && lead < 0xF0 ? 3
                              : lead >= 0xF0 && lead < 0xF5 ? 4
                                                            : 0;
        if (length == 0 || i + length > text.size()) return false;
        for (size_t k = 1; k < length; ++k)
            if ((static_cast<uint8_t>(text[i + k]) & 0xC0) != 0x80) return false;
        i += length;
    }
    return true;
}

} // namespace

std::string toUTF8Text(std::string_view bytes) {
    if (bytes.starts_with("\xEF\xBB\xBF")) bytes.remove_prefix(3);
    if (isUTF8(bytes)) return std::string(bytes);
    std::string text;
    for (const char c : bytes) {
        const auto byte = static_cast<uint8_t>(c);
        if (byte < 0x80) {
            text += c;
        } else {
            text += static_cast<char>(0xC0 | byte >> 6);
            text += static_cast<char>(0x80 | (byte & 0x3F));
        }
    }
    return text;
}

std::string resolveName(const std::string& sheet, const std::string& name) {
    const fs::path folder = fs::path(sheet).parent_path();
    std::error_code none;
    const fs::path direct = folder / name; // an absolute name replaces the folder
    if (fs::exists(direct, none)) return direct;
    const size_t slash = name.find_last_of("/\\");
    return slash == std::string::npos ? direct : folder / name.substr(slash + 1);
}

int32_t parseTime(std::string_view text) {
    int32_t parts[3] = {0, 0, 0};
    size_t part = 0;
    int digits = 0;
    for (const char c : text) {
        if (c == ':') {
            if (digits == 0 || ++part > 2) return -1;
            digits = 0;
        } else if (c >= '0' && c <= '9' && ++digits <= 4) {
            parts[part] = parts[part] * 10 + (c - '0');
        } else {
            return -1;
        }
    }
    if (part != 2 || digits == 0 || parts[1] >= 60 || parts[2] >= kSectorsPerSecond) return -1;
    return (parts[0] * 60 + parts[1]) * kSectorsPerSecond + parts[2];
}

namespace {

std::string getExtension(const std::string& name) {
    std::string extension = fs::path(name).extension();
    for (char& c : extension) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return extension;
}

struct SFormat {
    const char* extension;
    SImageLayout (*read)(const std::string& path);
};
constexpr SFormat kFormats[] = {
    {".cue", readCueImage}, {".iso", readIsoImage}, {".nrg", readNrgImage}, {".toc", readTocImage}};

} // namespace

bool isImageName(const std::string& name) {
    const std::string extension = getExtension(name);
    return std::any_of(std::begin(kFormats), std::end(kFormats),
                       [&](const SFormat& format) { return extension == format.extension; });
}

SImageLayout readImage(const std::string& path) {
    const std::string extension = getExtension(path);
    for (const SFormat& format : kFormats) {
        if (extension != format.extension) continue;
        SImageLayout layout = format.read(path);
        checkLayout(layout, path);
        return layout;
    }
    throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT,
                     path + " is not a disc image: .cue, .iso, .nrg and .toc are known");
}

int getSectorBytes(ESectorForm form) {
    switch (form) {
    case ESectorForm::data:
        return kDataSectorBytes;
    case ESectorForm::withSubheader:
        return 2336;
    case ESectorForm::audioWithSub:
    case ESectorForm::rawWithSub:
        return 2448;
    default:
        return kAudioSectorBytes;
    }
}

bool isAudioForm(ESectorForm form) {
    return form == ESectorForm::audio || form == ESectorForm::audioSwapped ||
           form == ESectorForm::audioWithSub || form == ESectorForm::silence;
}

void checkLayout(const SImageLayout& layout, const std::string& path) {
    const auto refuse = [&](const std::string& reason) -> CDiscError {
        return {DISCIO_ERROR_UNSUPPORTED_FORMAT, path + ": " + reason};
    };
    const STableOfContents& contents = layout.contents;
    if (contents.tracks.empty()) throw refuse("there are no tracks");
    if (contents.tracks.size() > kMaxTracks) throw refuse("there are more than 99 tracks");
    int32_t end = -kLeadInSectors;
    int number = 0;
    for (const STrack& track : contents.tracks) {
        const std::string name = "track " + std::to_string(track.number);
        if (track.number <= number || track.number > kMaxTracks) throw refuse(name + " is out of order");
        if (track.pregap < 0 || track.start - track.pregap < end)
            throw refuse(name + " starts before the previous one ends");
        if (track.length <= 0) throw refuse(name + " is empty");
        number = track.number;
        end = track.end();
    }
    if (contents.leadOut < end) throw refuse("the last track ends behind the disc");
    int32_t next = 0;
    for (const SExtent& extent : layout.extents) {
        if (extent.start != next || extent.count <= 0) throw refuse("its sectors have a hole");
        next += extent.count;
    }
    if (next < end) throw refuse("its files are shorter than its tracks");
}

} // namespace discio
