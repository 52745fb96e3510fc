// Sound files of every format, and access to other programs that read and write their tags.
#pragma once

#include "filetag/FileTagFactory.h"
#include "filetag/ICoverArtFileTag.h"
#include "peru/Errors.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <nlohmann/json.hpp>

#include <codecvt>
#include <locale>
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

// The UTF-8 of peru does not hold every character.
inline P<peru::IString> fromStandard(const std::string& utf8) {
    const std::u16string units =
        std::wstring_convert<std::codecvt_utf8_utf16<char16_t>, char16_t>().from_bytes(utf8);
    return peru::CString::fromUTF16(units.data(), static_cast<int32_t>(units.size()));
}

inline std::string toStandard(const P<peru::IString>& text) {
    return std::wstring_convert<std::codecvt_utf8_utf16<char16_t>, char16_t>().to_bytes(
        peru::CString::toStdU16String(text));
}

inline P<filetag::IFileTag> open(const std::filesystem::path& file) {
    return filetag::CFileTagFactory::get()->create(toURI(file));
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
        if (extension == "wav") std::filesystem::copy_file(wave, source);
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
