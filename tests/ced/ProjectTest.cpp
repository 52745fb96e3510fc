#include "ced/Project.h"
#include "ced/GraphicTableContent.h"
#include "ced/ItemType.h"
#include "graphics/Elements.h"
#include "graphics/storage/ZipCatalogue.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <cmath>

using namespace ced;
using tests::P;

namespace {

// A project of another program: a target, a format with a picture, an entry and attributes that this version
// does not know.
constexpr const char* kForeign = R"(<project version="3" creator="Later 9" print-cutmarks="true"
 print-coloured="false" season="spring"><content title="Füße" mood="calm"><items><item title="a &amp; b"><attachment-thumb
 name="image7.jpg"/><lyrics>la la</lyrics></item></items></content><formats shelf="2"><format id="x.1" name="a4_sheet"><sheet
 wx-format="3"><item type="disc" width="117"/></sheet></format></formats><disc format="x.1" glue="no"><item
 theme-name="autumn" corner="round"><weight value="2"/><graphic-document><image unique="5"><attachment-bitmap
 name="image7.jpg"/></image></graphic-document></item></disc><jewel-case format="x.1"
 theme-name="t"><graphic-document/><graphic-document/></jewel-case><cassette><item><graphic-document><image
 unique="5"/></graphic-document></item></cassette><attachment-sound name="sound1.ogg"/></project>)";

std::string makeForeign(std::mt19937& random) {
    const auto bitmap = tests::makeBitmap(random, false);
    return tests::makeArchive({{"project.xml", kForeign},
                               {"image7.jpg", bitmap->Encode(graphics::EBitmapFormat::jpg)},
                               {"image0.jpg", "not referred to"},
                               {"sound1.ogg", "OggS"},
                               {"../escaped", "x"}});
}

} // namespace

TEST(Project, CarriesAlongWhatItDoesNotKnow) {
    std::mt19937 random(1);
    const tests::CTempFolder folder;
    const auto first = CProject::Open(tests::toURI(folder.write("a.cedprj", makeForeign(random))));
    EXPECT_TRUE(first->IsFromLaterVersion());
    ASSERT_EQ(first->GetReports().size(), 2u); // the version and the name "../escaped"
    EXPECT_EQ(first->GetCreator(), "Later 9");
    EXPECT_TRUE(first->HasCutMarks());
    EXPECT_FALSE(first->IsColoured());
    ASSERT_TRUE(first->GetTarget(TargetType::disc));
    EXPECT_EQ(first->GetTarget(TargetType::disc)->GetItems()[0]->GetThemeName(), "autumn");
    EXPECT_EQ(first->GetTarget(TargetType::jewelCase)->GetItems().size(), 2u);
    EXPECT_EQ(first->FindFormat("x.1")->GetAttribute("name"), "a4_sheet");
    ASSERT_EQ(first->GetDocuments().size(), 3u);
    // The target that is unknown shares its picture with the known one.
    EXPECT_EQ(first->GetOtherTargets()[0].second->GetItems()[0]->GetDocument()->GetElement(0),
              first->GetTarget(TargetType::disc)->GetItems()[0]->GetDocument()->GetElement(0));

    // Through both containers and back.
    const std::string archive = first->ToArchive();
    const std::string xml = first->ToXml();
    EXPECT_EQ(CProject::FromBytes(archive)->ToArchive(), archive);
    EXPECT_EQ(CProject::FromBytes(archive)->ToXml(), xml);
    EXPECT_EQ(CProject::FromBytes(xml)->ToXml(), xml);
    for (const char* part : {"version=\"3\"", "season=\"spring\"", "mood=\"calm\"", "title=\"a &amp; b\"",
                             "<lyrics>la la</lyrics>", "shelf=\"2\"", "wx-format=\"3\"", "glue=\"no\"",
                             "corner=\"round\"", "<weight value=\"2\" />", "<cassette>", "sound1.ogg"})
        EXPECT_NE(xml.find(part), std::string::npos) << part << " in\n" << xml;
    folder.write("b.cedprj", archive);
    folder.write("b.xml", xml);
    EXPECT_EQ(tests::CProcess({"xmllint", "--noout", "b.xml"}, folder.path().string()).wait().exitCode, 0);
    for (const std::string entry : {"image0.jpg", "sound1.ogg"}) {
        const auto unzip = tests::CProcess({"unzip", "-p", "b.cedprj", entry}, folder.path().string()).wait();
        EXPECT_EQ(unzip.out, entry == "image0.jpg" ? "not referred to" : "OggS") << unzip.err;
    }
}

TEST(Project, ReadsEveryKindOfFile) {
    std::mt19937 random(2);
    const std::string picture = tests::makeBitmap(random, false)->Encode(graphics::EBitmapFormat::jpg);
    const std::string items =
        "<disc><item><attachment-thumbnail name=\"image0.jpg\"/><format type=\"disc\" width=\"116\"/>"
        "<graphic-document><label text=\"a\"/><table-content/></graphic-document></item></disc>";
    const struct {
        std::string bytes;
        EProjectFile kind;
        size_t count; // of designs
    } files[] = {
        {tests::makeArchive(
             {{"template.xml", "<template version=\"2\">" + items + "</template>"}, {"image0.jpg", picture}}),
         EProjectFile::designs, 1},
        {tests::makeArchive(
             {{"theme.xml", "<theme version=\"2\">" + items + "</theme>"}, {"image0.jpg", picture}}),
         EProjectFile::theme, 1},
        {"<project>" + items + "</project>", EProjectFile::exported, 1},
        {tests::makeArchive(
             {{"graphic-document.xml", "<project><graphic-document><label/></graphic-document></project>"}}),
         EProjectFile::clipboard, 1},
        {tests::makeArchive({{"jewel-case-back.jpg", picture},
                             {"jewel-case-front,folded.jpg", picture},
                             {"disc,folded.jpg", picture},
                             {"slim-case.jpg", "no picture"}}),
         EProjectFile::coverPages, 2},
    };
    for (const auto& file : files) {
        const auto project = CProject::FromBytes(file.bytes);
        EXPECT_EQ(project->GetFileKind(), file.kind);
        size_t count = 0;
        for (const auto& [name, document] : project->GetDocuments()) count += document->GetItems().size();
        EXPECT_EQ(count, file.count) << static_cast<int>(file.kind);
        EXPECT_EQ(CProject::FromBytes(project->ToArchive())->GetDocuments().size(), 1u);
        if (file.kind != EProjectFile::exported) continue;
        const auto design = project->GetDocuments()[0].second->GetItems()[0]->GetDocument();
        EXPECT_TRUE(P<CGraphicTableContent>(design->GetElement(1)));
    }
    const auto folded =
        CProject::FromBytes(files[4].bytes)->GetTarget(TargetType::jewelCase)->GetItems()[0]->GetDocument();
    EXPECT_EQ(folded->GetSourceBox(), (graphics::SRect{0, 0, 242, 121}));
    EXPECT_EQ(folded->GetBoundingBox(), folded->GetSourceBox());
}

// Names of entries that stores give make attachments; everything else remains XML.
TEST(Project, TakesAttachmentsFromOneContainerToAnother) {
    std::mt19937 random(3);
    const std::string picture = tests::makeBitmap(random, true)->Encode(graphics::EBitmapFormat::png);
    std::vector<graphics::SArchiveEntry> entries;
    std::string content;
    const std::pair<const char*, bool> names[] = {
        {"memory7", true},    {"memory", false},       {"memory7x", false},  {"xmemory7", false},
        {"text5.xml", true},  {"text.xml", false},     {"text5", false},     {"image3.png", true},
        {"image.png", false}, {"picture3.png", false}, {"image3.gif", false}};
    for (const auto& [name, isTaken] : names) {
        const std::string key(1, static_cast<char>('a' + entries.size()));
        content += "<attachment-" + key + " mark=\"" + key + "\" name=\"" + name + "\"/>";
        entries.push_back({name, std::string(name).find("image") == 0 ? picture : "data"});
    }
    content += "<attachment-z name=\"memory8\"/><attachment-z name=\"memory9\"/><other name=\"memory7\"/>";
    entries.push_back({"project.xml", "<project><content>" + content + "</content></project>"});
    const std::string xml = CProject::FromBytes(tests::makeArchive(entries))->ToXml();
    for (const auto& [name, isTaken] : names)
        EXPECT_EQ(xml.find("\" name=\"" + std::string(name) + "\"") == std::string::npos, isTaken) << name;
    for (const char* const part :
         {"mark=\"a\"", "mark=\"e\"", "mark=\"h\"", "memory8", "memory9", "<other name"})
        EXPECT_NE(xml.find(part), std::string::npos) << part << xml;

    // The same from text, in which the names say nothing.
    const std::string embedded = "<project><content><attachment-a "
                                 "mark=\"1\"><base64>bTc=</base64></attachment-a><attachment-richtextbuffer>"
                                 "<base64>PHI+</base64></attachment-richtextbuffer></content></project>";
    graphics::CZipCatalogue catalogue(CProject::FromBytes(embedded)->ToArchive());
    EXPECT_EQ(catalogue.ReadEntry("memory0"), "m7");
    EXPECT_EQ(catalogue.ReadEntry("text1.xml"), "<r>");
    for (const std::string& text : {xml, embedded}) {
        const std::string again = CProject::FromBytes(text)->ToXml();
        EXPECT_EQ(CProject::FromBytes(CProject::FromBytes(text)->ToArchive())->ToXml(), again);
        EXPECT_EQ(CProject::FromBytes(again)->ToXml(), again);
    }
    const auto others = CProject::FromBytes(
        "<project><cassette><graphic-document/></cassette><disk><item/></disk></project>");
    ASSERT_EQ(others->GetDocuments().size(), 1u);
    EXPECT_EQ(others->GetDocuments()[0].first, "cassette");
}

TEST(ItemType, HasNamesAndSizes) {
    std::string all;
    for (int value = -1; value <= kItemTypeCount; ++value) {
        const auto type = static_cast<ItemType>(value);
        const graphics::SSize size = getDefaultSize(type), folded = getDefaultSize(type, true);
        all += ItemTypeToXml(type) + ", " + ItemTypeToStr(type) + (isFoldable(type) ? ", foldable" : "") +
               ", " + std::to_string(std::lround(size.width)) + "x" +
               std::to_string(std::lround(size.height)) + "; ";
        EXPECT_EQ(folded, (graphics::SSize{2 * size.width, size.height}));
        EXPECT_EQ(ItemTypeFromXml(ItemTypeToXml(type)),
                  value < 0 || value >= kItemTypeCount ? std::nullopt : std::optional(type));
    }
    for (int value = -1; value <= kTargetTypeCount + 1; ++value) {
        const auto type = static_cast<TargetType>(value);
        all += TargetTypeToXml(type) + ", " + TargetTypeToStr(type) + ":";
        for (const ItemType item : getItemTypes(type)) all += " " + ItemTypeToXml(item);
        all += "; ";
        EXPECT_EQ(TargetTypeFromXml(TargetTypeToXml(type)),
                  value < 0 || value >= kTargetTypeCount ? std::nullopt : std::optional(type));
    }
    EXPECT_EQ(
        all,
        "unknown, Unknown, 0x0; dvd-case, DVD Case, 273x183; booklet, DVD Booklet, foldable, 110x180; "
        "slim-case, Slim Case, foldable, 121x121; jewel-case-front, Jewel Case (Front), foldable, 121x121; "
        "jewel-case-back, Jewel Case (Back), 151x118; disc, Disc, 117x117; blu-ray-case, Blu-ray Case, "
        "270x150; "
        "unknown, Unknown, 0x0; unknown, Unknown:; dvd-case, DVD Case: dvd-case; booklet, DVD Booklet: "
        "booklet; "
        "slim-case, Slim Case: slim-case; jewel-case, Jewel Case: jewel-case-front jewel-case-back; "
        "blu-ray-case, Blu-ray Case: blu-ray-case; disc, Disc: disc; unknown, Unknown:; unknown, Unknown:; ");
}
