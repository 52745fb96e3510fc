// Copying whole tags between formats, with mutagen as writer and judge.
#include "Support.h"
#include "filetag/TagTransfer.h"

#include <gmock/gmock.h>

#include <set>

using namespace peru;
using namespace filetag;
using tests::CTempFolder;
using tests::toURI;

namespace {

constexpr const char* kFormats[] = {"mp3", "flac", "oga", "opus", "m4a", "wma", "aiff", "wav", "wv"};

std::filesystem::path makePlain(const CTempFolder& folder, const std::string& name,
                                const std::string& format) {
    static const CTempFolder made;
    const auto source = made / ("sound." + format);
    if (!std::filesystem::exists(source))
        tests::run({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "sine=duration=0.3:sample_rate=48000",
                    "-map_metadata", "-1", "-fflags", "+bitexact", source});
    const auto file = folder / (name + "." + format);
    std::filesystem::copy_file(source, file, std::filesystem::copy_options::overwrite_existing);
    return file;
}

using CFields = std::map<std::string, std::vector<std::string>>;

CFields getFields(const STags& tags) {
    CFields fields;
    for (const STagField& field : tags.fields)
        for (const P<IString>& value : field.values)
            fields[tests::text(field.key)].push_back(tests::toStandard(value));
    return fields;
}

STags makeTags(const CFields& fields, const std::vector<STagPicture>& pictures) {
    STags tags;
    tags.pictures = pictures;
    for (const auto& [key, values] : fields) {
        STagField& field = tags.fields.emplace_back(STagField{tests::fromStandard(key), {}});
        for (const std::string& value : values) field.values.push_back(tests::fromStandard(value));
    }
    return tags;
}

STagPicture makePicture(int32_t type, const std::string& mimeType, const std::string& bytes) {
    const P<CMemoryBlock> data = make<CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), data->getData());
    return {data, tests::fromStandard(mimeType), tests::fromStandard("Umschl\u00e4ge"), type, 64, 32, 24, 0};
}

std::string toString(const STagPicture& picture) {
    return std::string(reinterpret_cast<const char*>(picture.data->getData()),
                       static_cast<size_t>(picture.data->getSize()));
}

const CFields kFields{{"TITLE", {"T\u00eftel \U0001f3b5"}},
                      {"ARTIST", {"One", "Other"}},
                      {"ALBUM", {"Album"}},
                      {"ALBUMARTIST", {"Both"}},
                      {"TRACKNUMBER", {"3/12"}},
                      {"DISCNUMBER", {"1/2"}},
                      {"DATE", {"1999-04-01"}},
                      {"GENRE", {"Jazz"}},
                      {"COMMENT", {"A comment"}},
                      {"COMPOSER", {"Somebody", "Another"}},
                      {"LYRICS", {"la\nla"}},
                      {"REPLAYGAIN_TRACK_GAIN", {"-7.03 dB"}},
                      {"MUSICBRAINZ_ALBUMID", {"b1a9c0e9-d987-4042-ae91-78d6a3267d69"}},
                      {"SOMETHING OF MINE", {"a", "b"}}};

} // namespace

TEST(TagTransfer, CarriesEverythingBetweenAllFormats) {
    const CTempFolder folder;
    const std::string jpeg = "\xff\xd8\xff";
    const std::vector<STagPicture> pictures{makePicture(3, "image/png", "\x89PNG" + std::string(300000, 'f')),
                                            makePicture(4, "image/jpeg", jpeg + "back"),
                                            makePicture(17, "image/jpeg", jpeg + "fish")};
    std::map<std::string, std::string> sounds;
    for (const std::string to : kFormats) sounds[to] = tests::hashSound(makePlain(folder, "target", to));
    for (const std::string from : kFormats) {
        const auto source = makePlain(folder, "source", from);
        const bool ape = from == "wv"; // holds front and back covers only
        EXPECT_EQ(writeAllTags(toURI(source), makeTags(kFields, pictures)).lostPictures.size(),
                  ape ? 1u : 0u);
        for (const std::string to : kFormats) {
            // Formats that share their tag with another one are read the same way for every target.
            if ((from == "oga" || from == "opus" || from == "aiff" || from == "wav") && to != "mp3") continue;
            SCOPED_TRACE(from + " to " + to);
            const auto target = makePlain(folder, "target", to);
            const STransferReport report = transferTags(toURI(source), toURI(target));
            // The pictures of MP4 have no types.
            const size_t kept = to != "wv" ? (ape ? 2u : 3u) : from == "m4a" ? 1u : 2u;
            EXPECT_EQ(report.lostFields.size(), 0u) << tests::text(report.lostFields.front());
            EXPECT_EQ(report.lostPictures.size(), (ape ? 2u : 3u) - kept);
            const STags found = readAllTags(toURI(target));
            CFields fields = getFields(found);
            for (const char* own : {"ENCODER", "ENCODEDBY", "ENCODING"}) fields.erase(own);
            EXPECT_EQ(fields, kFields);
            ASSERT_EQ(found.pictures.size(), kept);
            std::map<std::string, int32_t> types;
            for (const STagPicture& picture : found.pictures) types[toString(picture)] = picture.fileType;
            EXPECT_TRUE(types.contains(toString(pictures[0])));
            if (from != "m4a" && to != "m4a") {
                EXPECT_EQ(types[toString(pictures[0])], 3);
                EXPECT_EQ(types[jpeg + "back"], 4);
            }
            if (from != "flac") continue;
            EXPECT_EQ(tests::hashSound(target), sounds[to]);
            const std::string seen = tests::run({"ffprobe", "-v", "error", "-show_entries",
                                                 "format_tags:stream_tags", "-of", "json", target})
                                         .out;
            for (const char* text : {"T\u00eftel \U0001f3b5", "Jazz", "1999"})
                EXPECT_NE(seen.find(text), std::string::npos) << text << seen;
        }
    }
}

TEST(TagTransfer, ReportsWhatTheTargetCannotHold) {
    const CTempFolder folder;
    const auto source = makePlain(folder, "a", "mp3");
    tests::judge({"extras", source}); // with a PRIV frame
    setTagField(toURI(source), "TITLE", {tests::fromStandard(std::string(40000, 'x'))});
    setTagField(toURI(source), "TRACKNUMBER", {tests::fromStandard("A1")});
    const auto names = [](const STransferReport& report) {
        std::set<std::string> result;
        for (const P<IString>& name : report.lostFields) result.insert(tests::text(name));
        return result;
    };
    const auto transfer = [&](const char* format) {
        return names(transferTags(toURI(source), toURI(makePlain(folder, "b", format))));
    };
    EXPECT_THAT(transfer("flac"), testing::ElementsAre(testing::StartsWith("PRIV")));
    EXPECT_THAT(transfer("wma"), testing::ElementsAre(testing::StartsWith("PRIV"), "TITLE"));
    EXPECT_THAT(transfer("m4a"),
                testing::ElementsAre("COMMENT:ITUNNORM", testing::StartsWith("PRIV"), "TRACKNUMBER"));

    // What only the target has stays, and a failed change leaves the file alone.
    const auto target = makePlain(folder, "c", "m4a");
    setTagField(toURI(target), "MOOD", {tests::fromStandard("calm")});
    setTagPictures(toURI(target), {makePicture(3, "image/png", "\x89PNG own")});
    for (int i = 0; i < 2; ++i) transferTags(toURI(source), toURI(target)); // pictures come but once
    const std::string before = tests::readFile(target);
    EXPECT_EQ(getFields(readAllTags(toURI(target)))["MOOD"], std::vector<std::string>{"calm"});
    EXPECT_EQ(readAllTags(toURI(target)).pictures.size(), 3u);
    EXPECT_THROW(setTagField(toURI(target), "trackNumber", {tests::fromStandard("A1")}), CFileError);
    EXPECT_EQ(tests::readFile(target), before);
    setTagField(toURI(target), "mood", {});
    EXPECT_FALSE(getFields(readAllTags(toURI(target))).contains("MOOD"));
}

TEST(TagTransfer, NamesAndNumbersOfOtherFormatsAreTheSame) {
    const CTempFolder folder;
    const auto add = [&](const char* format, const CFields& fields) {
        const auto file = makePlain(folder, "a", format);
        const STransferReport report = addTags(toURI(file), makeTags(fields, {}));
        EXPECT_TRUE(report.lostFields.empty()) << tests::text(report.lostFields.front());
        CFields found = getFields(readAllTags(toURI(file)));
        for (const char* own : {"ENCODER", "ENCODEDBY", "ENCODING"}) found.erase(own);
        return found;
    };
    const CFields common{
        {"ALBUMARTIST", {"a"}}, {"COMMENT", {"d"}}, {"DATE", {"1999"}}, {"TRACKNUMBER", {"3"}}};
    for (const char* format : {"mp3", "flac", "m4a"}) {
        EXPECT_EQ(add(format, {{"ALBUM ARTIST", {"a"}},
                               {"DESCRIPTION", {"d"}},
                               {"YEAR", {"1999"}},
                               {"TRACKNUM", {"3"}},
                               {"ENCODERSETTINGS", {"x"}}}),
                  common);
        EXPECT_EQ(add(format, {{"COMMENT:COMMENT", {"d"}}}), (CFields{{"COMMENT", {"d"}}}));
    }
    const CFields both{{"COMMENT", {"c"}}, {"DESCRIPTION", {"d"}}};
    EXPECT_EQ(add("flac", both), both);
    EXPECT_EQ(add("m4a", {{"TRACKNUMBER", {"03/012"}}, {"DISCNUMBER", {"2/0"}}, {"BPM", {"090"}}}),
              (CFields{{"TRACKNUMBER", {"3/12"}}, {"DISCNUMBER", {"2"}}, {"BPM", {"90"}}}));
    const auto file = makePlain(folder, "a", "m4a");
    for (const CFields& own : {CFields{{"MINE", {"a"}}, {"OURS", {"b", "c"}}}, {{"OURS", {"c"}}}}) {
        writeAllTags(toURI(file), makeTags(own, {}));
        EXPECT_EQ(getFields(readAllTags(toURI(file))), own);
    }
}

// A Vorbis comment in FLAC has at most 16 MB.
TEST(TagTransfer, LeavesOutTheLongestFieldsWhereNotAllFit) {
    const CTempFolder folder;
    const auto target = makePlain(folder, "a", "flac");
    const std::string long1(9'000'000, 'l'), long2(8'500'000, 'm');
    setTagField(toURI(target), "MOOD", {tests::fromStandard(long2)});
    const STransferReport report =
        addTags(toURI(target), makeTags({{"LYRICS", {long1}}, {"TITLE", {"T"}}}, {}));
    ASSERT_EQ(report.lostFields.size(), 1u);
    EXPECT_EQ(tests::text(report.lostFields[0]), "LYRICS");
    EXPECT_EQ(tests::run({"metaflac", "--show-tag=TITLE", target}).out, "TITLE=T\n");
    CFields fields = getFields(readAllTags(toURI(target)));
    EXPECT_TRUE(fields["MOOD"].at(0) == long2) << "what was there stays";
    EXPECT_EQ(tests::errorOf([&] {
                  setTagField(toURI(target), "LYRICS", {tests::fromStandard(long1)});
              }).find("The field 'LYRICS' cannot be stored"),
              0u);
    EXPECT_TRUE(getFields(readAllTags(toURI(target))) == fields);
}

TEST(TagTransfer, ChangesFieldsAndPicturesTogether) {
    const CTempFolder folder;
    for (const std::string format : {"flac", "mp3", "opus", "m4a", "wav"}) {
        SCOPED_TRACE(format);
        const auto file = makePlain(folder, "a", format);
        writeAllTags(toURI(file), makeTags({{"TITLE", {"T"}}, {"MOOD", {"m"}}},
                                           {makePicture(3, "image/png", "\x89PNG 1")}));
        STagChange change;
        change.fields = makeTags({{"title", {"a", "b"}}, {"COMPOSER", {"C"}}}, {}).fields;
        change.fields.push_back({tests::fromStandard("mood"), {}});
        change.addedPictures = {makePicture(3, "image/jpeg", "\xff\xd8\xff 2")};
        change.removedPictures = {3};
        EXPECT_TRUE(changeTags(toURI(file), change));
        const STags tags = readAllTags(toURI(file));
        CFields fields = getFields(tags);
        fields.erase("ENCODER");
        EXPECT_EQ(fields, (CFields{{"COMPOSER", {"C"}}, {"TITLE", {"a", "b"}}}));
        ASSERT_EQ(tags.pictures.size(), 1u);
        EXPECT_EQ(toString(tags.pictures[0]), "\xff\xd8\xff 2");
        // In MP4 pictures have no description.
        EXPECT_EQ(changeTags(toURI(file), change), format == "m4a") << "like that already";
        const std::string before = tests::readFile(file);
        EXPECT_FALSE(changeTags(
            toURI(file), {{{tests::fromStandard("composer"), {tests::fromStandard("C")}}}, {4}, false, {}}));
        EXPECT_TRUE(tests::readFile(file) == before);
        EXPECT_TRUE(changeTags(toURI(file), {{}, {}, true, {}}));
        EXPECT_TRUE(readAllTags(toURI(file)).pictures.empty());
    }
}

TEST(TagTransfer, RefusesWhatIsNoSound) {
    const CTempFolder folder;
    const std::string wave = tests::readFile(makePlain(folder, "a", "wav"));
    for (const auto& [name, content] :
         std::map<std::string, std::string>{{"text.mp3", std::string(5000, 't')},
                                            {"wide.wav", "RF64" + wave.substr(4)},
                                            {"text.txt", "text"}}) {
        const auto file = folder.write(name, content);
        EXPECT_THROW(readAllTags(toURI(file)), CFileFormatNotSupportedError) << name;
        EXPECT_THROW(setTagField(toURI(file), "TITLE", {tests::fromStandard("a")}), CFileError) << name;
        EXPECT_EQ(tests::readFile(file), content);
    }
}
