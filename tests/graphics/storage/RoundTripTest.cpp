// Documents that come back as they were, and other programs that read the files.
#include "graphics/Elements.h"
#include "graphics/storage/DataObjectGraphicDocument.h"
#include "graphics/storage/DocumentArchive.h"
#include "graphics/storage/XmlNames.h"
#include "peru/xml/XmlDocument.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <regex>

using namespace graphics;
using tests::P;

namespace {

SaveContent saveOne(const P<CGraphicDocument>& document) {
    return [&document](const P<peru::IXmlNode>& root, IResourceOutputStore& store) {
        document->Save(root->addChildNode("graphic-document"), store);
    };
}

LoadContent loadOne(P<CGraphicDocument>& document) {
    return [&document](const P<peru::IXmlNode>& root, IResourceInputStore& store) {
        document = peru::make<CGraphicDocument>();
        document->Load(root->getChildNode("graphic-document"), store);
    };
}

// A text of any bytes in which the parts of encoded names are frequent.
std::string makeName(std::mt19937& random) {
    static const char* const kParts[] = {"_", "__", "__L__", "32", "a", "ü", " ", "-", "\xFF", "\x01", "95"};
    std::string name;
    for (unsigned i = random() % 7; i > 0; --i) name += kParts[random() % 11];
    return name;
}

} // namespace

class ManyDocuments : public testing::TestWithParam<unsigned> {};

TEST_P(ManyDocuments, RestoreEveryField) {
    std::mt19937 random(GetParam());
    for (int i = 0; i < 250; ++i) {
        const auto document = tests::makeDocument(random);
        const auto image = peru::make<CGraphicImage>(), other = peru::make<CGraphicImage>();
        image->SetBitmap(tests::makeBitmap(random, i % 2));
        other->SetBitmap(image->GetBitmap());
        other->AddTag(makeName(random));
        document->Add(image);
        document->Add(other);
        P<CGraphicDocument> copy;
        const std::string archive = WriteArchive(kProjectForm, saveOne(document), true);
        ReadArchive(kProjectForm, archive, loadOne(copy));
        ASSERT_EQ(WriteArchive(kProjectForm, saveOne(copy), true), archive) << i;
        const auto& elements = copy->GetElements();
        ASSERT_EQ(P<CGraphicImage>(elements[elements.size() - 2])->GetBitmap(),
                  P<CGraphicImage>(elements.back())->GetBitmap());
        const std::string xml = WriteXml("project", saveOne(document));
        ReadXml("project", xml, loadOne(copy));
        ASSERT_EQ(WriteXml("project", saveOne(copy)), xml) << i;
        ASSERT_EQ(WriteXml("project", saveOne(CDataObjectGraphicDocument(document).GetDocument())), xml) << i;
    }
}

INSTANTIATE_TEST_SUITE_P(RoundTrips, ManyDocuments, testing::Range(0u, 8u));

TEST(RoundTrips, NamesHoldEveryText) {
    std::mt19937 random(12);
    const auto document = peru::make<peru::CXmlDocument>();
    const auto root = document->addChildNode("root");
    for (int i = 0; i < 20000; ++i) {
        const std::string text = makeName(random), name = encodeName(text);
        ASSERT_EQ(decodeName(name), text) << name;
        ASSERT_NO_THROW(root->removeChildNode(root->addChildNode(peru::CString::fromUTF8(name)))) << name;
    }
    EXPECT_EQ(encodeName("1st Try"), "__L__1st__32__Try");
    EXPECT_EQ(encodeName("back-cover_2"), "back-cover_2");
}

TEST(RoundTrips, OtherProgramsReadTheFiles) {
    std::mt19937 random(13);
    const auto document = peru::make<CGraphicDocument>();
    for (int i = 0; i < 150; ++i) document->Add(tests::makeElement(random, 0));
    const tests::CTempFolder folder;
    folder.write("a.zip", WriteArchive(kProjectForm, saveOne(document)));
    folder.write("b.zip", WriteArchive(kProjectForm, saveOne(document), true));
    folder.write("a.xml", WriteXml("project", saveOne(document)));
    const auto run = [&](const std::vector<std::string>& command) {
        const auto result = tests::CProcess(command, folder.path().string()).wait();
        EXPECT_EQ(result.exitCode, 0) << command[0] << ": " << result.out << result.err;
        return result.out;
    };
    const std::string schema = TONEWRIGHT_TEST_DATA "/../../docs/project.xsd";
    run({"xmllint", "--noout", "--schema", schema, "a.xml"});
    for (const std::string name : {"a", "b"}) {
        run({"python3", "-m", "zipfile", "-t", name + ".zip"});
        run({"unzip", "-q", name + ".zip", "-d", name});
        run({"xmllint", "--noout", "--schema", schema, name + "/project.xml"});
        // Every picture has the type of its ending and a size.
        const std::string pictures =
            run({"exiftool", "-r", "-q", "-ext", "jpg", "-ext", "png", "-ext", "jng", "-p",
                 "$FileName ${FileTypeExtension;$_ = lc} ${ImageWidth}", name});
        const std::regex line("image[0-9]+\\.(\\w+) \\1 [1-9]");
        const auto lines = std::distance(std::sregex_iterator(pictures.begin(), pictures.end(), line), {});
        EXPECT_GT(lines, 5);
        EXPECT_EQ(lines, std::count(pictures.begin(), pictures.end(), '\n')) << pictures;
    }
}
