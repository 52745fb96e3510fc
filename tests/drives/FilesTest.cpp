// Files on discs, as the streams of their URIs.
#include "peru/Errors.h"
#include "peru/streams/IStreamManager.h"
#include "peru/streams/StreamTools.h"
#include "peru/uri/URI.h"
#include "support/Process.h"
#include "support/TempFolder.h"
#include "tonewright/tonewright.h"

#include <gtest/gtest.h>

using namespace tests;

TEST(Files, InAnImageAreStreamsWhileTheLibraryIsInUse) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/sub");
    folder.write("in/sub/a file", "12345");
    ASSERT_EQ(run({"genisoimage", "-quiet", "-J", "-o", "disc.iso", "in"}, folder.path()).exitCode, 0);
    const auto toURI = [&](const std::string& name) {
        const std::string text = "discioppdiscimage://" + (folder / "disc.iso").string() + "/" + name;
        return peru::P<peru::IURI>(peru::make<peru::CURI>(text.c_str()));
    };
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
    const peru::P<peru::IInStream> stream = peru::getStreamManager()->getInStream(toURI("sub/a%20file"));
    EXPECT_EQ(peru::readAll(*stream), "12345");
    EXPECT_THROW(peru::getStreamManager()->getInStream(toURI("sub/another")), peru::CFileNotFoundError);
    TONEWRIGHT_DeInitAll();
    EXPECT_THROW(peru::getStreamManager()->getInStream(toURI("sub/a%20file")),
                 peru::CURITypeNotSupportedError);
}

TEST(Canceller, EndsWithTheProcessItIsStartedFor) {
    const auto folder = std::filesystem::path(TONEWRIGHT_PROGRAM).parent_path().parent_path() / "lib";
    for (const std::string name : {"CancelAutoplay2", "CancelAutoplay2Session"}) {
        const std::vector<std::string> command{"timeout", "60", folder / name};
        const auto with = [&](const std::string& id) {
            return std::vector<std::string>{command[0], command[1], command[2], id, "dummy"};
        };
        for (const char* id : {"", "0", "-5", "x", "1x"}) {
            const SProcessResult refused = run(with(id));
            EXPECT_EQ(refused.exitCode, 2) << id;
            EXPECT_EQ(refused.err, "usage: " + name + " PROCESS-ID dummy\n");
        }
        EXPECT_EQ(run(command).exitCode, 2);
        CProcess parent({"sleep", "100"});
        const std::string id = std::to_string(parent.getId());
        CProcess canceller(with(id), {}, {{"DBUS_SESSION_BUS_ADDRESS", "unix:path=/nowhere"}});
        ::usleep(500'000);
        EXPECT_TRUE(canceller.isRunning());
        parent.signal(SIGKILL);
        parent.wait();
        EXPECT_EQ(canceller.wait().exitCode, 0);
        EXPECT_EQ(run(with(id)).exitCode, 0) << "the process has ended already";
    }
}
