#include "sonora2/context/SonoraContextAudio.h"

#include "peru/system/IPathes.h"
#include "peru/uri/URI.h"
#include "sonora2/ScriptedMedia.h"
#include "sonora2/context/LogManager.h"
#include "sonora2/context/SonoraError.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <thread>

namespace {

using peru::CString;
using peru::make;
using peru::P;
using sonora2::audio::CSonoraContextAudio;
using tests::deserialise;
using tests::serialise;
using namespace peru::literals;

std::string textOf(const P<peru::IString>& text) {
    return CString::toStdString(text);
}

P<CSonoraContextAudio> makeFilledContext() {
    P<CSonoraContextAudio> context = make<CSonoraContextAudio>();
    context->setSwitchA(false);
    context->setSwitchB(true);
    context->setFlags(0x8000000000000105u);
    context->addPluginName("wav");
    context->addPluginName(CString::fromUTF8("\xc3\xa4"));
    context->setParameter(0xfffffffe, "b", "2"_s);
    context->setParameter(0xfffffffe, "a", CString::fromUTF8("\xe2\x82\xac"));
    context->setParameter(3, "", nullptr);
    return context;
}

TEST(SonoraContext, HasOneSerialFormByteForByte) {
    using namespace std::string_literals;
    const std::string form = "\x00\x01"s
                             "\x05\x01\x00\x00\x00\x00\x00\x80"s
                             "\x02\x00"s
                             "\x03\x00\x00\x00wav"s
                             "\x02\x00\x00\x00\xc3\xa4"s
                             "\x02\x00"s
                             "\x03\x00\x00\x00\x01\x00\x00\x00\x00\x00\x00\x00\x00\x00"s
                             "\xfe\xff\xff\xff\x02\x00"s
                             "\x01\x00\x00\x00"s
                             "a"
                             "\x03\x00\x00\x00\xe2\x82\xac"s
                             "\x01\x00\x00\x00"s
                             "b"
                             "\x01\x00\x00\x00"s
                             "2";
    EXPECT_EQ(serialise(makeFilledContext()), form);
    EXPECT_EQ(serialise(make<CSonoraContextAudio>()), "\x01\x00"s + std::string(12, '\0'));

    const P<CSonoraContextAudio> copy = make<CSonoraContextAudio>();
    deserialise(copy, form);
    EXPECT_EQ(serialise(copy), form);
    // Reading adds to the existing content.
    copy->setParameter(0xfffffffe, "b", "old"_s);
    copy->setParameter(0xfffffffe, "c", "kept"_s);
    deserialise(copy, form);
    EXPECT_EQ(copy->getPluginNameCount(), 4);
    EXPECT_EQ(textOf(copy->getParameter(0xfffffffe, "b")), "2");
    EXPECT_EQ(textOf(copy->getParameter(0xfffffffe, "c")), "kept");
}

TEST(SonoraContext, LookingUpChangesNothing) {
    const P<CSonoraContextAudio> context = makeFilledContext();
    const std::string before = serialise(context);
    EXPECT_EQ(textOf(context->getParameter(99, "a")), "");
    EXPECT_EQ(textOf(context->getParameter(3, "a")), "");
    EXPECT_EQ(serialise(context), before);
    EXPECT_TRUE(context->hasFlags(0));
    EXPECT_TRUE(context->hasFlags(0x8000000000000004u));
    EXPECT_FALSE(context->hasFlags(0x8000000000000006u));
    for (int index : {-1, 2}) EXPECT_THROW(context->getPluginNameAt(index), peru::CException);
}

TEST(SonoraContext, ObjectsAndFoldersStayInTheProcess) {
    const P<CSonoraContextAudio> context = makeFilledContext();
    const std::string before = serialise(context);
    const P<peru::IBase> object = make<sonora2::common::CLogManager>();
    context->setHostObject(object);
    EXPECT_TRUE(context->getHostObject() == object);
    const auto folders = context->getBaseDirectories();
    folders->setPluginDirectory(make<peru::CURI>("file:///plugins/"));
    folders->setSlaveDirectory(make<peru::CURI>("file:///slave/"));
    EXPECT_EQ(textOf(folders->getPluginDirectory()->getAsString()), "file:///plugins/");
    EXPECT_EQ(textOf(folders->getSlaveDirectory()->getAsString()), "file:///slave/");
    EXPECT_EQ(serialise(context), before);
    EXPECT_TRUE(!context->getSwitchA() && make<CSonoraContextAudio>()->getSwitchA());
}

TEST(SonoraContext, FormThatIsCutShort_ChangesNothing) {
    const std::string form = serialise(makeFilledContext());
    const std::string untouched = serialise(make<CSonoraContextAudio>());
    for (size_t length = 0; length < form.size(); ++length) {
        const P<CSonoraContextAudio> context = make<CSonoraContextAudio>();
        try {
            deserialise(context, form.substr(0, length));
            EXPECT_GE(length, 12u) << "only a text at the end may be missing";
        } catch (const peru::CException&) {
            EXPECT_EQ(serialise(context), untouched) << length;
        }
    }
}

TEST(SonoraContext, RefusesToWriteWhatItsFormCannotCount) {
    const P<CSonoraContextAudio> context = make<CSonoraContextAudio>();
    for (int i = 0; i < 65536; ++i) context->addPluginName("x");
    const auto memory = make<peru::CMemoryIOStream>();
    EXPECT_THROW(context->writeTo(make<peru::CDataOutStream>(memory)), sonora2::common::CSonoraError);
    EXPECT_EQ(memory->getSize(), 0);
}

TEST(SonoraContext, IsReadByManyThreadsWhileItChanges) {
    const P<CSonoraContextAudio> context = makeFilledContext();
    std::vector<std::thread> readers;
    for (int t = 0; t < 3; ++t)
        readers.emplace_back([&] {
            for (int i = 0; i < 500; ++i) {
                EXPECT_TRUE(context->getMemoryManager());
                EXPECT_TRUE(context->getLogManager());
                EXPECT_EQ(textOf(context->getParameter(0xfffffffe, "a")), "\xe2\x82\xac");
                EXPECT_EQ(textOf(context->getPluginNameAt(0)), "wav");
                EXPECT_TRUE(context->getBaseDirectories()->getDataDirectory());
            }
        });
    const P<peru::IURI> folder = make<peru::CURI>("file:///data/");
    for (int i = 0; i < 500; ++i) {
        context->setMemoryManager(make<peru::CMemoryManager>());
        context->setLogManager(make<sonora2::common::CLogManager>());
        context->setParameter(static_cast<uint32_t>(i), "n", "v"_s);
        context->addPluginName("more");
        context->getBaseDirectories()->setDataDirectory(folder);
    }
    for (std::thread& reader : readers) reader.join();
}

TEST(SonoraLog, KeepsTheLastEntries) {
    const auto log = make<sonora2::common::CLogManager>();
    for (int i = 0; i < log->kKeptEntries + 3; ++i) log->log(2, CString::fromUTF8(std::to_string(i) + "!"));
    const std::string document = textOf(log->getDocument());
    EXPECT_EQ(document.find(">2!<"), std::string::npos);
    for (const char* kept : {">3!<", ">4!<", ">10002!<"})
        EXPECT_NE(document.find(kept), std::string::npos) << kept;
}

// Messages contain text from files and devices: whatever it is, the document must stay well-formed.
TEST(SonoraLog, WritesADocumentThatAnotherReaderUnderstands) {
    const tests::CTempFolder folder;
    const auto log = make<sonora2::common::CLogManager>();
    log->log(2, "a < b & \"c\" > 'd'"_s);
    log->log(77, CString::fromUTF8("gr\xc3\xbc\xc3\x9f"));
    log->log(0, nullptr);
    log->logException(peru::CError("no <disc>"));
    log->log(4, CString::fromUTF8(std::string("\x01\0\x1f\xff\xe2\x82\xac\xf0\x9f\x8e\xb5\xef\xbf\xbf", 14)));
    const std::string name =
        folder.write("log.xml", std::string(10000, 'x')).string(); // an older, longer one
    log->save(peru::getPathes()->fromPlatformPath(CString::fromUTF8(name)));

    const std::string query =
        "xmllint --xpath 'concat(name(/*),\"|\",count(//logentry[@time]),\"|\","
        "//logentry[1],\"|\",//logentry[1]/@level,\"|\",//logentry[2],\"|\","
        "//logentry[2]/@level,\"|\",//logentry[4],\"|\",//logentry[4]/@level,\"|\",//logentry[5])' " +
        name + " > " + (folder / "answer").string();
    ASSERT_EQ(std::system(query.c_str()), 0);
    EXPECT_EQ(tests::readFile(folder / "answer"),
              "textlog|5|a < b & \"c\" > 'd'|2|gr\xc3\xbc\xc3\x9f|77|"
              "Exception: Type='Error' Message='no <disc>'|0|????\xe2\x82\xac\xf0\x9f\x8e\xb5???\n");
}

} // namespace
