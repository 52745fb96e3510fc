// Projects on disks that fail, and projects that are damaged.
#include "ced/Project.h"
#include "filetag/FaultyCalls.h"
#include "graphics/Elements.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>

#include <sys/wait.h>

using namespace ced;
using testing::HasSubstr;
using tests::P;

namespace {

P<CProject> makeProject(unsigned seed) {
    std::mt19937 random(seed);
    const auto project = peru::make<CProject>();
    for (const TargetType target : {TargetType::disc, TargetType::booklet}) {
        const auto design = tests::makeDocument(random);
        const auto image = peru::make<graphics::CGraphicImage>();
        image->SetBitmap(tests::makeBitmap(random, target == TargetType::disc));
        design->Add(image);
        const auto document = peru::make<CDocument>();
        document->AddItem(peru::make<CItem>(design));
        project->SetTarget(target, document);
    }
    return project;
}

// "done", or the error of the operation; errors of other kinds say so.
std::string report(const std::function<void()>& operation) {
    try {
        operation();
        return "done";
    } catch (const peru::CFileError& error) {
        return tests::text(error.getDescription());
    } catch (const std::exception& error) {
        return std::string("not an error of a file: ") + error.what();
    }
}

std::string openBytes(const std::string& bytes, P<CProject>* project = nullptr) {
    try {
        const auto opened = CProject::FromBytes(bytes);
        if (project) *project = opened;
        return "done";
    } catch (const peru::CError& error) {
        return tests::text(error.getDescription());
    }
}

} // namespace

TEST(ProjectFaults, EveryFailingCallLeavesTheOldFileOrTheNewOne) {
    const tests::CTempFolder folder;
    const std::string before = makeProject(1)->ToArchive();
    const auto project = CProject::FromBytes(makeProject(2)->ToArchive());
    const auto file = tests::toURI(folder / "a.cedprj");
    const struct {
        const char* name;
        std::function<void()> run;
        std::string after;
    } operations[] = {{"save ", [&] { project->Save(file); }, project->ToArchive()},
                      {"export ", [&] { project->Export(file); }, project->ToXml()},
                      {"open ", [&] { CProject::Open(file); }, before}};
    for (const auto& [error, forGood] : {std::pair(EIO, false), {EOPNOTSUPP, false}, {ENOSPC, true}})
        for (const auto& operation : operations)
            for (int call = 1;; ++call) {
                SCOPED_TRACE(operation.name + std::to_string(error) + ", " + std::to_string(call));
                ASSERT_LT(call, 500);
                folder.write("a.cedprj", before);
                const auto run = tests::runWithFault({call, error, forGood},
                                                     [&] { return [&] { return report(operation.run); }; });
                if (!run.supported) GTEST_SKIP() << "calls cannot be intercepted";
                ASSERT_TRUE(WIFEXITED(run.status));
                ASSERT_THAT(run.report, testing::AnyOf("done", HasSubstr("a.cedprj")));
                ASSERT_EQ(tests::readFile(folder / "a.cedprj"),
                          run.report == "done" ? operation.after : before);
                ASSERT_EQ(tests::countEntries(folder.path()), 1u);
                if (!run.struck) {
                    ASSERT_EQ(run.report, "done");
                    break;
                }
            }
}

TEST(ProjectFaults, DamagedFilesAreReported) {
    std::mt19937 random(4);
    const std::string archive = makeProject(5)->ToArchive(), xml = makeProject(5)->ToXml();
    ASSERT_EQ(openBytes(archive), "done");
    ASSERT_EQ(openBytes(xml), "done");
    for (size_t i = 0; i < 200; ++i) {
        EXPECT_NE(openBytes(archive.substr(0, archive.size() * i / 200)), "done") << i;
        EXPECT_NE(openBytes(xml.substr(0, xml.size() * i / 200)), "done") << i;
    }
    for (int i = 0; i < 2000; ++i) {
        std::string flipped = i % 4 ? archive : xml;
        flipped[random() % flipped.size()] ^= static_cast<char>(1 << random() % 8);
        P<CProject> project;
        // What opens can be saved.
        openBytes(flipped, &project);
        if (project && i % 20 == 0) project->ToArchive();
    }
}

TEST(ProjectFaults, ErrorsNameTheEntryOrElement) {
    std::mt19937 random(6);
    std::string large = tests::makeBitmap(random, false)->Encode(graphics::EBitmapFormat::png);
    large[16] = large[20] = 0x7F; // the size in the header
    const auto withXml = [](const std::string& xml) { return tests::makeArchive({{"project.xml", xml}}); };
    const auto image = [](const std::string& content) {
        return "<project><disc><item><graphic-document><image>" + content +
               "</image></graphic-document></item></disc></project>";
    };
    const std::string attached = image("<attachment-bitmap name=\"image3.png\"/>");
    const struct {
        std::string file;
        const char* expected; // parts of the error, or of the report of a file that opens
    } cases[] = {
        {"", "XML"},
        {"PK", "project.xml"},
        {withXml("<theme/>"), "project.xml.*project"},
        {withXml("<project><disc>"), "project.xml.*line"},
        {withXml("<project>" + std::string(65 << 20, ' ')), "project.xml.* too large"}, // 200 kB
        {withXml(image("<size width=\"1,5\"/>")), "1,5.*width.*size"},
        {"<project version=\"two\"/>", "two.*version.*project"},
        {withXml(attached), "image3.png"},
        {tests::makeArchive({{"project.xml", attached}, {"image3.png", "no picture"}}), "image3.png.*header"},
        {tests::makeArchive({{"project.xml", attached}, {"image3.png", large}}), "image3.png.*too large"},
        {image("<attachment-bitmap extension=\"jpg\"><base64>?</base64></attachment-bitmap>"),
         "attachment-bitmap.*base64"},
        {"<project><disc><item><graphic-document><image "
         "filename=\"a.jpg\"/></graphic-document></item></disc></project>",
         "a.jpg"},
    };
    for (const auto& [file, expected] : cases) {
        P<CProject> project;
        std::string text = openBytes(file, &project);
        if (project) {
            ASSERT_EQ(project->GetReports().size(), 1u) << expected;
            text = project->GetReports()[0];
            const auto& element =
                project->GetTarget(TargetType::disc)->GetItems()[0]->GetDocument()->GetElement(0);
            EXPECT_FALSE(P<graphics::CGraphicImage>(element)->GetBitmap());
        }
        EXPECT_THAT(text, testing::ContainsRegex(expected));
    }
    std::string many = "<a b=\"\"/>";
    while (many.size() < 100 << 20) many += many; // twice as long each time
    EXPECT_THAT(openBytes(many), HasSubstr("too large"));
}
