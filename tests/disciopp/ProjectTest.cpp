#include "discio2/DiscSupport.h"
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
    static int s_ends = 0;
    s_ends = 0;
    DISCIO_PCMAudioStreamFuncs funcs{[](void*) { return 1.0; },
                                     nullptr,
                                     [](void*) { return 1; },
                                     [](void*) {},
                                     [](void*) { return 2; },
                                     [](void*) { return 44100; },
                                     [](void*) { return int64_t{588}; },
                                     [](void*) { return 1; },
                                     [](void*) {},
                                     [](void*) { return 0; },
                                     [](void*, void* pcm, int32_t frames, int32_t* delivered) {
                                         std::fill_n(static_cast<int16_t*>(pcm), 2 * frames, int16_t{7});
                                         *delivered = frames;
                                         return 1;
                                     },
                                     [](void*) { return int64_t{-1}; },
                                     [](void*, int64_t) { return 0; },
                                     [](void*) { return int64_t{0}; },
                                     [](void*) { ++s_ends; }};
    auto project = peru::make<CAudioCDDiscProject>();
    EXPECT_EQ(project->getSegmentCount(), 0);
    project->insertTrack(funcs, nullptr, -1);
    EXPECT_THROW(project->insertTrack(funcs, nullptr, 5), CDISCIOPPException);
    EXPECT_EQ(s_ends, 1);
    EXPECT_EQ(project->getSegmentCount(), 1);
    const P<peru::IURI> track = project->getRootURI()->appendPath("Track01.cda");
    {
        const P<ITrackStream> stream = openTrack(track);
        int16_t frame[2] = {};
        int32_t delivered = 0;
        ASSERT_EQ(stream->get().funcs->open(stream->get().user), 1);
        EXPECT_EQ(stream->get().funcs->read(stream->get().user, frame, 1, &delivered), 1);
        EXPECT_EQ(frame[1], 7);
    }
    EXPECT_THROW(openTrack(project->getRootURI()->appendPath("Track02.cda")), CDISCIOPPException);
    project.reset();
    EXPECT_EQ(s_ends, 2);
    EXPECT_THROW(openTrack(track), peru::CFileNotFoundError);
}
