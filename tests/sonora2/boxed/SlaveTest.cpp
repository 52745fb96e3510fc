// Slave processes that work, die and hang.
#include "sonora2/boxed/EncapsulatedSource.h"
#include "sonora2/boxed/SlaveHandler.h"

#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/BoxedFixture.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IMediaDescription.h"

#include <gmock/gmock.h>

namespace tests {

namespace {

using namespace sonora2::common;
using peru::P;
using testing::HasSubstr;

class Slave : public CBoxedTest {};

std::string bytesOf(const P<IAudioSource>& source) {
    std::string bytes;
    while (!source->isEOF())
        if (const auto chunk = source->getNextAudioChunk())
            bytes.append(reinterpret_cast<const char*>(chunk->getData()), chunk->getSize());
    return bytes;
}

TEST_F(Slave, Source_DeliversWhatThePlainOneDoes) {
    const P<IAudioSource> expected = open(*plain), source = open(*boxed);
    ASSERT_TRUE(source);
    EXPECT_NE(0, slaveOf());
    EXPECT_EQ(8000, source->getSampleRate());
    EXPECT_EQ(1.0, source->getDuration());
    EXPECT_TRUE(bytesOf(source) == bytesOf(expected));
    for (const double time : {0.25, 0.0, 0.99, 2.0}) {
        source->skipToTime(time);
        expected->skipToTime(time);
        EXPECT_TRUE(bytesOf(source) == bytesOf(expected)) << time;
    }
    EXPECT_FALSE(peru::interfaceCast<IMediaDescription>(source)) << "the source in the slave has none";
    source->close();
    EXPECT_FALSE(source->isOpened());
}

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
}

TEST_F(Slave, Death_IsAnErrorAndTheNextSourceWorks) {
    const size_t before = countDescriptors();
    {
        const P<IAudioSource> source = open(*boxed);
        source->getNextAudioChunk();
        signalSlave(SIGKILL);
        const std::string reason = reasonOf([&] { bytesOf(source); });
        EXPECT_THAT(reason, HasSubstr("testplugin_good"));
        EXPECT_THAT(reason, HasSubstr("x.tst"));
        EXPECT_THAT(reason, HasSubstr("signal 9"));
        EXPECT_EQ(reason, reasonOf([&] { source->skipToTime(0.0); })) << "no second reason";
        source->close();
        source->open();
        EXPECT_EQ(32000u, bytesOf(source).size()) << "another slave";
    }
    EXPECT_EQ(before, countDescriptors());
}

#ifndef TONEWRIGHT_SANITIZED
TEST_F(Slave, Crash_IsReportedWithThePluginAndTheFile) {
    const P<IAudioSource> source = open(*boxed);
    signalSlave(SIGSEGV);
    const std::string reason = reasonOf([&] { bytesOf(source); });
    EXPECT_THAT(reason,
                testing::StartsWith("CSonoraPluginBoxed::checkForSlaveError: Error in sonora2_slave:\n\n"));
    EXPECT_THAT(reason, HasSubstr("Plug-in: testplugin_good\nFile: "));
    EXPECT_THAT(reason, HasSubstr("Signal: SIGSEGV"));
    EXPECT_EQ(reason, reasonOf([&] { source->getNextAudioChunk(); }));
}
#endif

TEST_F(Slave, Hang_EndsWithTheDeadline) {
    context->setParameter(kBoxedParameterKey, kBoxedDeadlineParameter, peru::CString::fromUTF8("2000"));
    const P<IAudioSource> source = open(*boxed);
    ASSERT_TRUE(source);
    signalSlave(SIGSTOP);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_THAT(reasonOf([&] { bytesOf(source); }), HasSubstr("does not respond"));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(60));
    EXPECT_EQ(0, slaveOf()) << "it was killed";
}

TEST_F(Slave, Format_CrossesWithItsOptionalInterfaces) {
    const P<IAudioFormat> format = boxed->createAudioFormat(toURI(folder / "y.tst"), 8000, 2, 2);
    ASSERT_TRUE(format);
    EXPECT_EQ(8000, format->getSampleRate());
    EXPECT_EQ(32000, format->getEstimatedSizeBytes(1.0)) << "also while it is closed";
    format->open();
    const P<IAudioSource> source = open(*plain);
    while (!source->isEOF()) format->writeAudioChunk(source->getNextAudioChunk());
    EXPECT_TRUE(format->isOpened());
    peru::interfaceCast<IDiscardable>(format)->discard();
    EXPECT_FALSE(format->isOpened());
}

TEST_F(Slave, UnfinishedOutputOfADeadSlave_IsRemovedByDiscard) {
    const auto write = [this](const char* name) {
        const P<IAudioFormat> format = boxed->createAudioFormat(toURI(folder / name), 8000, 2, 2);
        format->open();
        return format;
    };
    folder.write("old.tst", "old");
    for (const char* name : {"old.tst", "new.tst"}) {
        const P<IAudioFormat> format = write(name);
        // What the plug-in would write.
        if (std::string(name) == "new.tst") folder.write(name, "new");
        signalSlave(SIGKILL);
        EXPECT_NE("", reasonOf([&] { format->close(); })) << "the file is not complete";
        peru::interfaceCast<IDiscardable>(format)->discard();
    }
    EXPECT_EQ("old", readFile(folder / "old.tst"));
}

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
