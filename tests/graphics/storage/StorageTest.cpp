#include "graphics/Elements.h"
#include "graphics/storage/DocumentArchive.h"
#include "graphics/storage/ZipCatalogue.h"
#include "peru/Errors.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <regex>

using namespace graphics;
using tests::P;

namespace {

// Documents below one root.
using Documents = std::vector<P<CGraphicDocument>>;

SaveContent saveAll(const Documents& documents) {
    return [&documents](const P<peru::IXmlNode>& root, IResourceOutputStore& store) {
        for (const auto& document : documents) document->Save(root->addChildNode("graphic-document"), store);
    };
}

LoadContent loadAll(Documents& documents) {
    return [&documents](const P<peru::IXmlNode>& root, IResourceInputStore& store) {
        for (auto children = root->getChildNodes(); children.hasMore();) {
            documents.push_back(peru::make<CGraphicDocument>());
            documents.back()->Load(children.getNext(), store);
        }
    };
}

std::string toArchive(const Documents& documents, bool isLossless = false) {
    return WriteArchive(kProjectForm, saveAll(documents), isLossless);
}

Documents fromArchive(const std::string& bytes) {
    Documents documents;
    ReadArchive(kProjectForm, bytes, loadAll(documents));
    return documents;
}

Documents fromXml(const std::string& content,
                  CBase64Resources::EMode mode = CBase64Resources::EMode::embedded) {
    Documents documents;
    ReadXml("project", "<project><graphic-document>" + content + "</graphic-document></project>",
            loadAll(documents), mode);
    return documents;
}

P<CGraphicImage> makeImage(const P<CBitmap>& bitmap, const std::string& fileName = {}) {
    auto image = peru::make<CGraphicImage>();
    image->SetBitmap(bitmap);
    image->SetFileName(fileName);
    return image;
}

} // namespace

// '@' stands for attributes of every element, '~' for its box.
TEST(Storage, WritesEachFieldInTheDocumentedForm) {
    std::string xml = R"(<project>
<graphic-document version="1"><bounding-box left="-1" top="0" width="4" height="4" />
<content-box left="1" top="2" width="3" height="4.5" />
<shape unique="1" name="own" coloured="false" mirror-x="true" mirror-y="true" rotation="90" visible="false"
 modified="true" content-id="c" content-index="2" text-id="t" shape="free-form" corner-radius="1">~
<tags><front /></tags><groups><group number="2" /></groups>
<gradient><start red="1" green="2" blue="3" alpha="4" /><end red="5" green="6" blue="7" alpha="8" /></gradient>
<brush style="111"><color red="9" green="10" blue="11" alpha="12" /></brush>
<pen style="101" width="0.7"><color red="13" green="14" blue="15" alpha="16" /></pen>
<free-form name="own"><graphic-document version="1">
<bounding-box left="1" top="2" width="0" height="0" />
<point unique="2" @><center x="1" y="2" /><size width="0" height="0" /></point></graphic-document></free-form></shape>
<image unique="3" @ noscale="true" filename="a.jpg">~
<scale-margins left="1" top="2" right="3" bottom="4" left-factor="5" top-factor="6" right-factor="7" bottom-factor="8" />
</image><text-circle unique="4" @ vertical-placement="2" circle-type="concav"><center x="1" y="2" />
<size width="3" height="3" /><attachment-richtextbuffer><base64>PHI+</base64></attachment-richtextbuffer></text-circle>
<table type-name="table-content" unique="5" type="table-content" @>~
<rows><row height="5" content-id="h" /></rows>
<cols><col width="6" visible="false" content-id="i" name="n" hidden-by-theme="true" /></cols>
<cells><cell margin="2" content-id="j" vertical-align="bottom" /></cells></table>
<arrow unique="6" @>~<start x="-0.5" y="0" /><end x="2.5" y="4" />
<pen style="100" width="2"><color red="0" green="0" blue="0" alpha="255" /></pen></arrow>
<state-button unique="7" @ label="l" hint="h">~</state-button>
<label unique="8" @ text="t">~<font name="f" pointsize="7" style="93" weight="700" underlined="true" />
<color red="1" green="2" blue="3" alpha="4" /></label>
<mirror unique="9" @>~<graphic-document version="1"><bounding-box left="-1" top="0.5" width="4" height="3" />
<shape unique="1" /></graphic-document></mirror>
<xdata><a type="int" value="7" /><b type="rect" value="1,2,3,4" /></xdata></graphic-document></project>)";
    for (const auto& [from, to] : {std::pair("@", "coloured=\"true\" rotation=\"0\" visible=\"true\""),
                                   {"~", "<center x=\"1\" y=\"2\" /><size width=\"3\" height=\"4\" />"},
                                   {">\n", ">"},
                                   {"\n", ""}})
        xml = std::regex_replace(xml, std::regex(from), to);
    Documents documents;
    ReadXml("project", xml, loadAll(documents));
    EXPECT_EQ(P<CGraphicMirror>(documents[0]->GetElement(7))->GetDocument()->GetElement(0),
              documents[0]->GetElement(0));
    const std::string written = WriteXml("project", saveAll(documents));
    EXPECT_EQ(std::regex_replace(written.substr(written.find("<project>")), std::regex("\n *"), ""), xml);
}

TEST(Storage, LimitsWhatIsUnpacked) {
    const std::string zeros(12 << 20, '\0');
    const std::string archive = WriteArchive(kProjectForm, [](const auto&, auto&) {}, false,
                                             {{"stored.png", zeros}, {"deflated", zeros}});
    for (const char* name : {"stored.png", "deflated"}) {
        CZipCatalogue catalogue(archive);
        int count = 0;
        EXPECT_THROW(for (; count < 50; ++count) catalogue.ReadEntry(name), peru::CError);
        EXPECT_GE(count, 20) << name;
    }
}

TEST(Storage, ChoosesTheFormatOfBitmaps) {
    std::mt19937 random(8);
    const auto document = peru::make<CGraphicDocument>();
    document->Add(makeImage(tests::makeBitmap(random, true), "a.ICO"));
    document->Add(makeImage(tests::makeBitmap(random, true), "a.png"));
    document->Add(makeImage(tests::makeBitmap(random, false)));
    const auto expectEntries = [&](bool isLossless, std::vector<std::string> names) {
        CZipCatalogue catalogue(toArchive({document}, isLossless));
        for (const std::string& name : names) EXPECT_TRUE(catalogue.HasEntry(name)) << name;
    };
    expectEntries(false, {"image0.ico", "image1.jng", "image2.jpg"});
    expectEntries(true, {"image0.ico", "image1.png", "image2.png"});
    // In the mode of file names, the file is preferred to the data.
    const tests::CTempFolder folder;
    const auto bitmap = tests::makeBitmap(random, false);
    const auto path = folder.write("a.dat", bitmap->Encode(EBitmapFormat::png)).string();
    const Documents named{peru::make<CGraphicDocument>()};
    named[0]->Add(makeImage(bitmap, path));
    const auto mode = CBase64Resources::EMode::fileNames;
    const std::string xml = WriteXml("project", saveAll(named), mode);
    EXPECT_EQ(xml.find("attachment-bitmap"), std::string::npos);
    Documents copies;
    ReadXml("project", xml, loadAll(copies), mode);
    EXPECT_EQ(P<CGraphicImage>(copies[0]->GetElement(0))->GetBitmap()->GetPixels(), bitmap->GetPixels());
}

TEST(Storage, ReadsOldAndForeignContent) {
    const auto document =
        fromXml("<table-content><rows><row/></rows><cols><col/><col/></cols></table-content>"
                "<note/><text unique=\"0\"/><custom type-name=\"later\"/><text unique=\"-3\"/>"
                "<line><start x=\"10\" y=\"5\"/><end x=\"30\" y=\"9\"/></line>")[0];
    ASSERT_EQ(document->GetCount(), 4);
    EXPECT_EQ(document->GetElement(3)->GetRect(), (SRect{10, 5, 20, 4}));
    EXPECT_EQ(document->GetElement(0)->GetTypeName(), "table-content");
    EXPECT_EQ(document->GetElement(0)->GetType(), GraphicElementType::table);
    EXPECT_EQ(P<CGraphicTable>(document->GetElement(0))->GetCell(0, 1).margin, 0.5);
    EXPECT_NE(document->GetElement(1), document->GetElement(2));
}

TEST(Storage, RejectsInvalidContent) {
    for (const char* content :
         {"<text><center x=\"1,5\"/></text>", "<text rotation=\"inf\"/>", "<text visible=\"yes\"/>",
          "<shape shape=\"oval\"/>", "<shape><brush><color red=\"256\"/></brush></shape>",
          "<text-circle circle-type=\"oval\"/>", "<text content-index=\"99999999999\"/>",
          "<table><rows><row/></rows><cols><col/></cols><cells><cell "
          "vertical-align=\"left\"/></cells></table>",
          "<mirror unique=\"1\"><graphic-document><mirror unique=\"1\"/></graphic-document></mirror>",
          "<table unique=\"1\"/><table-content unique=\"1\"/>", "<text>",
          "<xdata><a type=\"int\" value=\"x\"/></xdata>"})
        EXPECT_THROW(fromXml(content), peru::CError) << content;
    std::string deep;
    for (int i = 0; i < 100000; ++i) deep += "<mirror><graphic-document>";
    EXPECT_THROW(fromXml(deep), peru::CError);
    EXPECT_THROW(ReadXml("project", "<theme/>", {}), peru::CError);
    const std::string theme = WriteArchive(kThemeForm, [](const auto&, auto&) {});
    EXPECT_EQ(tests::errorOf<peru::CError>([&] { fromArchive(theme); }),
              "The archive has no entry \"project.xml\".");
}
