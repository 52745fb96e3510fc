// Slave processes that work, die and hang.
#include "sonora2/boxed/EncapsulatedSource.h"
#include "sonora2/boxed/SlaveHandler.h"
#include "sonora2/boxed/SonoraPluginBoxed.h"

#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/BoxedFixture.h"
#include "sonora2/media/IMediaDescription.h"
#include "support/MediaBase.h"

#include <gmock/gmock.h>

namespace tests {

namespace {

using namespace sonora2::common;
using peru::P;
using testing::HasSubstr;

class Slave : public CBoxedTest {};

TEST_F(Slave, RefusalOfThePlugin_IsThatOfThePlainOne) {
    EXPECT_FALSE(open(*plain, "refuse.tst"));
    const SFailure expected = getLastFailure();
    EXPECT_FALSE(open(*boxed, "refuse.tst"));
    EXPECT_EQ(expected.message, getLastFailure().message);
    EXPECT_EQ(expected.kind, getLastFailure().kind);
}

// Queries about extensions must not cost a process.
TEST_F(Slave, Extensions_AreKnownWithoutASlave) {
    const size_t before = countDescriptors();
    EXPECT_EQ(1, boxed->getValidExtensions(kAudioSource)->getCount());
    EXPECT_EQ(before, countDescriptors());
    EXPECT_EQ(1, boxed->getPlugin(0)->getValidExtensions(kAudioSource)->getCount()) << "asks a slave";
    EXPECT_EQ(plain->getPlugin(0)->getValidTypes(), boxed->getPlugin(0)->getValidTypes());
    const P<peru::IString> name = peru::newString("testplugin_good");
    EXPECT_TRUE(peru::make<CSonoraPluginBoxed>(context, name)->getPluginName()->equals(name));
}

#ifndef TONEWRIGHT_SANITIZED
TEST_F(Slave, Crash_IsReportedWithThePluginAndTheFile) {
    const P<IAudioSource> source = open(*boxed);
    endChildren(SIGSEGV);
    const std::string reason = reasonOf([&] { readAll(source); });
    EXPECT_THAT(reason,
                testing::StartsWith("CSonoraPluginBoxed::checkForSlaveError: Error in sonora2_slave:\n\n"));
    EXPECT_THAT(reason, HasSubstr("Plug-in: testplugin_good\nFile: "));
    EXPECT_THAT(reason, HasSubstr("Signal: SIGSEGV"));
    EXPECT_EQ(reason, reasonOf([&] { source->getNextAudioChunk(); }));
}
#endif

TEST_F(Slave, MissingProgramOrPlugin_IsAnErrorOfTheCall) {
    const P<CSlaveHandler> handler =
        peru::make<CSlaveHandler>(context, peru::newString("testplugin_nowhere"), kSlaveNiceValue);
    EXPECT_NO_THROW(handler->getClient());
    const P<CEncapsulatedSource> source = peru::make<CEncapsulatedSource>(
        context, peru::newString("testplugin_nowhere"), toURI(folder / "x.tst"), kAudioSource, nullptr);
    EXPECT_THAT(reasonOf([&] { source->open(); }), HasSubstr("could not load plugin: testplugin_nowhere.so"));
    EXPECT_EQ(0.0, source->getDuration());
    EXPECT_FALSE(source->getNextAudioChunk()) << "answered without a slave";
}

} // namespace

} // namespace tests
