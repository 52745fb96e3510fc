// Sound files of every format, and access to other programs that read and write their tags.
#pragma once

#include "filetag/ICoverArtFileTag.h"
#include "peru/Errors.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <nlohmann/json.hpp>

#include <array>
#include <map>
#include <string>

namespace tests {

using peru::P;

struct SField {
    const char* name; // used by judge.py
    void (filetag::IFileTag::*set)(const peru::CStringArg& text);
    P<peru::IString> (filetag::IFileTag::*get)() const;
};

inline constexpr SField kFields[] = {
    {"title", &filetag::IFileTag::setTitle, &filetag::IFileTag::getTitle},
    {"artist", &filetag::IFileTag::setArtist, &filetag::IFileTag::getArtist},
    {"album", &filetag::IFileTag::setAlbum, &filetag::IFileTag::getAlbum},
    {"albumArtist", &filetag::IFileTag::setAlbumArtist, &filetag::IFileTag::getAlbumArtist},
    {"trackNumber", &filetag::IFileTag::setTrackNumber, &filetag::IFileTag::getTrackNumber},
    {"year", &filetag::IFileTag::setYear, &filetag::IFileTag::getYear},
    {"genre", &filetag::IFileTag::setGenre, &filetag::IFileTag::getGenre},
    {"comment", &filetag::IFileTag::setComment, &filetag::IFileTag::getComment},
};

using CTexts = std::map<std::string, std::string>; // by the field's name, in UTF-8

// Converts standard UTF-8 to a string that can hold every character.
inline P<peru::IString> fromStandard(const std::string& utf8) {
    std::u16string units;
    for (size_t i = 0; i < utf8.size();) {
        const auto lead = static_cast<unsigned char>(utf8[i]);
        const int more = lead < 0x80 ? 0 : lead < 0xe0 ? 1 : lead < 0xf0 ? 2 : 3;
        char32_t code = more == 0 ? lead : lead & (0x3f >> more);
        for (++i; i < utf8.size() && (utf8[i] & 0xc0) == 0x80; ++i) code = code << 6 | (utf8[i] & 0x3f);
        if (code >= 0x10000) {
            units += static_cast<char16_t>(0xd7c0 + (code >> 10));
            code = 0xdc00 + (code & 0x3ff);
        }
        units += static_cast<char16_t>(code);
    }
    return peru::CString::fromUTF16(units.data(), static_cast<int32_t>(units.size()));
}

inline std::string toStandard(const P<peru::IString>& text) {
    // The JSON parser converts escaped surrogate pairs to UTF-8.
    std::string escaped = "\"";
    for (const char16_t unit : peru::CString::toStdU16String(text)) {
        char code[8];
        std::snprintf(code, sizeof code, "\\u%04x", static_cast<unsigned>(unit));
        escaped += code;
    }
    return nlohmann::json::parse(escaped + "\"").get<std::string>();
}

inline CTexts readFields(const filetag::IFileTag& tag) {
    CTexts texts;
    for (const SField& field : kFields) texts[field.name] = toStandard((tag.*field.get)());
    return texts;
}

// One second of sound without a tag. Each format is encoded only once per process.
inline std::filesystem::path makeSound(const CTempFolder& folder, const std::string& extension) {
    static const CTempFolder made;
    const std::filesystem::path source = made / ("sound." + extension);
    if (!std::filesystem::exists(source)) {
        const std::string wave = made / "source.wav";
        run({"sox", "-R", "-n", "-r", "44100", "-b", "16", "-c", "2", wave, "synth", "1", "pinknoise", "vol",
             "0.5"});
        if (extension == "mp3") run({"lame", "--quiet", "-t", wave, source});
        if (extension == "flac") run({"flac", "-s", wave, "-o", source});
        if (extension == "ogg") run({"oggenc", "-Q", wave, "-o", source});
        if (extension == "wma")
            run({"ffmpeg", "-v", "error", "-i", wave, "-c:a", "wmav2", "-map_metadata", "-1", source});
    }
    const std::filesystem::path file = folder / ("sound." + extension);
    std::filesystem::copy_file(source, file, std::filesystem::copy_options::overwrite_existing);
    return file;
}

// Runs a script that reads or writes tags with mutagen, and returns its JSON output.
inline nlohmann::json judge(std::vector<std::string> arguments, const std::string& script = "judge.py") {
    arguments.insert(arguments.begin(),
                     {"/usr/bin/python3", std::string(TONEWRIGHT_TEST_DATA) + "/filetag/" + script});
    const SProcessResult result = run(arguments);
    EXPECT_EQ(result.exitCode, 0) << result.err;
    return result.out.empty() ? nlohmann::json() : nlohmann::json::parse(result.out);
}

// Hash of all decoded samples.
inline std::string hashSound(const std::filesystem::path& file) {
    return run({"ffmpeg", "-v", "error", "-i", file, "-map", "0:a", "-f", "md5", "-"}).out;
}

} // namespace tests
