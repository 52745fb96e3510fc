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
