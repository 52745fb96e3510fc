#include "graphics/Elements.h"
#include "graphics/storage/DocumentArchive.h"
#include "graphics/storage/ZipCatalogue.h"
#include "peru/Errors.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

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

TEST(Storage, WritesTheDocumentedForm) {
    const auto document = peru::make<CGraphicDocument>();
    const auto shape = peru::make<CGraphicShape>();
    shape->SetName("disc");
    shape->SetShapeType(EShapeType::ellipse);
    shape->SetCenter(60, 59.5);
    shape->SetSize(120, 8);
    shape->SetRotation(90);
    shape->SetMirrored(EAxis::y, true);
    shape->AddTag("front");
    shape->AddGroup(2);
    shape->SetCornerRadius(1);
    document->Add(shape);
    const std::string xml = WriteXml("project", saveAll({document}));
    for (const char* part :
         {"<graphic-document version=\"1\">",
          "<bounding-box left=\"56\" top=\"-0.5\" width=\"8\" height=\"120\" />",
          "<shape unique=\"1\" name=\"disc\" coloured=\"true\" mirror-y=\"true\" rotation=\"90\" "
          "visible=\"true\" shape=\"ellipse\" corner-radius=\"1\">",
          "<center x=\"60\" y=\"59.5\" />", "<size width=\"120\" height=\"8\" />", "<front />",
          "<group number=\"2\" />", "<color red=\"255\" green=\"255\" blue=\"255\" alpha=\"255\" />"})
        EXPECT_NE(xml.find(part), std::string::npos) << part << " in\n" << xml;
}

TEST(Storage, SharesElementsAndBitmaps) {
    std::mt19937 random(7);
    const auto image = makeImage(tests::makeBitmap(random, true));
    const Documents documents{peru::make<CGraphicDocument>(), peru::make<CGraphicDocument>()};
    documents[0]->Add(image);
    documents[1]->Add(image);
    documents[1]->Add(makeImage(image->GetBitmap()));
    const std::string archive = toArchive(documents);
    CZipCatalogue catalogue(archive);
    EXPECT_TRUE(catalogue.HasEntry("image0.jng"));
    EXPECT_FALSE(catalogue.HasEntry("image1.jng"));
    const std::string xml = catalogue.ReadEntry("project.xml");
    EXPECT_NE(xml.find("<image unique=\"1\" />"), std::string::npos) << xml;
    const Documents copies = fromArchive(archive);
    EXPECT_EQ(copies[0]->GetElement(0), copies[1]->GetElement(0));
    EXPECT_EQ(P<CGraphicImage>(copies[0]->GetElement(0))->GetBitmap(),
              P<CGraphicImage>(copies[1]->GetElement(1))->GetBitmap());
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
                "<note/><text unique=\"0\"/><custom type-name=\"later\"/><text unique=\"-3\"/>")[0];
    ASSERT_EQ(document->GetCount(), 3);
    EXPECT_EQ(document->GetElement(0)->GetTypeName(), "table-content");
    EXPECT_EQ(document->GetElement(0)->GetType(), GraphicElementType::table);
    EXPECT_EQ(P<CGraphicTable>(document->GetElement(0))->GetCell(0, 1).margin, 0.5);
    EXPECT_NE(document->GetElement(1), document->GetElement(2));
    // A missing attachment leaves the element without it.
    const auto archive = WriteArchive(kProjectForm, [](const P<peru::IXmlNode>& root, IResourceOutputStore&) {
        const auto image = root->addChildNode("graphic-document")->addChildNode("image");
        image->addChildNode("attachment-bitmap")->setProperty("name", "../image0.jpg");
    });
    EXPECT_FALSE(P<CGraphicImage>(fromArchive(archive)[0]->GetElement(0))->GetBitmap());
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
    try {
        fromArchive(WriteArchive(kThemeForm, [](const P<peru::IXmlNode>&, IResourceOutputStore&) {}));
        FAIL();
    } catch (const peru::CError& error) {
        EXPECT_STREQ(error.what(), "The archive has no entry \"project.xml\".");
    }
}
