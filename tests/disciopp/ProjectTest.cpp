#include "discio2/ProjectSupport.h"
#include "disciopp/AudioCDDiscProject.h"
#include "disciopp/DataDiscProject.h"
#include "disciopp/Errors.h"
#include "disciopp/ITrackStream.h"
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "support/Files.h"

using namespace tests;
using namespace disciopp;

namespace {

struct Projects : testing::Test {
    ~Projects() override { peru::CGlobalObjFactory::shutdown(); }
    std::string list(const P<peru::IFileObject>& object) {
        std::string names;
        const P<peru::IFileObjectCursor> cursor = object->enumerate();
        while (cursor->next()) {
            const P<peru::IFileObject> entry = cursor->getFileObject();
            names += text(entry->getName()) + (entry->isFolder() ? "(" + list(entry) + ")" : "") + " ";
        }
        return names;
    }
    CTempFolder folder;
};

} // namespace

TEST_F(Projects, DataProjectIsADiscAndAFileSystem) {
    const auto project = peru::make<CDataDiscProject>();
    const auto source = peru::make<peru::CURI>(("file://" + folder.write("x", "12345").string()).c_str());
    const P<peru::IURI> root = project->getRootURI();
    project->addFile(source, root->appendPath("Outer/Inner/a.txt"), true);
    project->createFolders(root->appendPath("Outer/Empty/"));
    EXPECT_EQ(list(project->getRoot()), "Outer(Empty() Inner(a.txt ) ) ");
    project->createFolders(peru::make<peru::CURI>("/Outer//Empty/Deep"));
    project->addFile(source, root->appendPath("b"), true);
    EXPECT_EQ(list(project->getRoot()), "Outer(Empty(Deep() ) Inner(a.txt ) ) b ");
    const P<peru::IFileObject> file = project->getFileObject(root->appendPath("Outer/Inner/a.txt"));
    ASSERT_TRUE(file);
    EXPECT_EQ(file->getSize(), 5);
    EXPECT_TRUE(project->isVirtual());
    EXPECT_EQ(text(project->getTitle()), "[No Title]");
    EXPECT_THROW(project->addFile(source, root->appendPath("No/a"), false), CDISCIOPPException);
    EXPECT_THROW(project->createFolder(root->appendPath("Outer/")), CDISCIOPPException);
    EXPECT_THROW(project->deleteFile(file->getURI()), peru::CReadOnlyError);
}

TEST_F(Projects, TracksAreOpenedByURIWhileTheProjectLives) {
    SSource source(makeSectors(1, 1));
    auto project = peru::make<CAudioCDDiscProject>();
    EXPECT_EQ(project->getSegmentCount(), 0);
    project->insertTrack(SSource::getFuncs(), &source, -1);
    EXPECT_THROW(project->insertTrack(SSource::getFuncs(), &source, 5), CDISCIOPPException);
    EXPECT_EQ(source.ended, 1);
    DISCIO_PCMAudioStreamFuncs incomplete = SSource::getFuncs();
    incomplete.read = nullptr;
    EXPECT_THROW(project->insertTrack(incomplete, &source, -1), CDISCIOPPException);
    EXPECT_EQ(source.ended, 2);
    EXPECT_EQ(project->getSegmentCount(), 1);
    const auto empty = peru::make<CAudioCDDiscProject>();
    const P<peru::IURI> track = project->getRootURI()->appendPath("Track01.cda");
    {
        const P<ITrackStream> stream = openTrack(track);
        std::string frame(4, '\0');
        int32_t delivered = 0;
        ASSERT_EQ(stream->get().funcs->open(stream->get().user), 1);
        EXPECT_EQ(stream->get().funcs->read(stream->get().user, frame.data(), 1, &delivered), 1);
        EXPECT_EQ(frame, source.pcm.substr(0, 4));
    }
    EXPECT_THROW(openTrack(project->getRootURI()->appendPath("Track02.cda")), CDISCIOPPException);
    EXPECT_THROW(openTrack(empty->getRootURI()->appendPath("Track01.cda")), CDISCIOPPException);
    project.reset();
    EXPECT_EQ(source.ended, 3);
    EXPECT_THROW(openTrack(track), peru::CFileNotFoundError);
}
