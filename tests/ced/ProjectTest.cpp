#include "ced/Project.h"
#include "ced/GraphicTableContent.h"
#include "ced/ItemType.h"
#include "graphics/Elements.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

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
    return graphics::WriteArchive({"unused.xml", "unused"}, [](const auto&, auto&) {}, false,
                                  {{"project.xml", kForeign},
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
    const auto makeArchive = [](const std::vector<graphics::SArchiveEntry>& entries) {
        return graphics::WriteArchive(
            {"unused.xml", "unused"}, [](const auto&, auto&) {}, false, entries);
    };
    const std::string items =
        "<disc><item><attachment-thumbnail name=\"image0.jpg\"/><format type=\"disc\" width=\"116\"/>"
        "<graphic-document><label text=\"a\"/><table-content/></graphic-document></item></disc>";
    const struct {
        std::string bytes;
        EProjectFile kind;
        size_t count; // of designs
    } files[] = {
        {makeArchive(
             {{"template.xml", "<template version=\"2\">" + items + "</template>"}, {"image0.jpg", picture}}),
         EProjectFile::designs, 1},
        {makeArchive({{"theme.xml", "<theme version=\"2\">" + items + "</theme>"}, {"image0.jpg", picture}}),
         EProjectFile::theme, 1},
        {"<project>" + items + "</project>", EProjectFile::exported, 1},
        {makeArchive(
             {{"graphic-document.xml", "<project><graphic-document><label/></graphic-document></project>"}}),
         EProjectFile::clipboard, 1},
        {makeArchive({{"jewel-case-back.jpg", picture},
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
