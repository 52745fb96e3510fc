#include "peru/Errors.h"
#include "peru/Rival.h"
#include "peru/log/LogArea.h"
#include "peru/log/LogManager.h"
#include "peru/log/TextFileLog.h"
#include "peru/streams/StringStreams.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <ctime>

using namespace peru;
using namespace peru::literals;
using tests::text;

namespace {

// Calls a function before each write and counts flushes.
class CTextStream : public CStringOutStream {
public:
    void write(const void* buffer, int64_t size) override {
        if (const auto call = onWrite) call(); // a copy, since the call may replace it
        CStringOutStream::write(buffer, size);
    }
    void flush() override { ++flushes; }

    int flushes = 0;
    std::function<void()> onWrite;
};

// Records messages as "level source text|extra@time".
class CMemoryLog : public CLogBase {
public:
    explicit CMemoryLog(std::vector<std::string>& journal, std::string name = "")
        : m_journal(journal), m_name(std::move(name)) {}
    void enterArea(const P<IString>& name) override { record("enter " + text(name)); }
    void leaveArea(const P<IString>& name) override { record("leave " + text(name)); }
    void write(const SLogMessage& message) override {
        if (!isWanted(message.level)) return;
        std::string line =
            std::to_string(message.level) + " " + text(message.source) + " " + text(message.text);
        for (const P<IString>& extra : message.extraLines) line += "|" + text(extra);
        record(line + "@" + std::to_string(message.time));
    }
    std::function<void()> onCall;

private:
    void record(const std::string& line) {
        if (const auto call = onCall) call(); // a copy, since the call may replace it
        m_journal.push_back(m_name + line);
    }
    std::vector<std::string>& m_journal;
    std::string m_name;
};

using Journal = std::vector<std::string>;

constexpr int64_t kTime = 1000000000000; // 01:46:40 UTC, 07:16:40 here

class TextFileLog : public testing::Test {
protected:
    void SetUp() override { tzset(); }
    void TearDown() override {
        zone.reset();
        tzset();
    }
    std::string written() const { return text(stream->getString()); }
    std::string written(const SLogMessage& message) {
        stream->reset();
        log->write(message);
        return written();
    }
    std::string written(int32_t level) { return written({level, nullptr, "x"_s, {}, kTime}); }
    // Replaces the time, which has eight characters, at the start of each line.
    static std::string withoutTimes(std::string text) {
        for (size_t start = 0; start < text.size(); start = text.find('\n', start) + 1)
            text.replace(start, 8, "T");
        return text;
    }
    std::optional<tests::CEnvironment> zone{std::in_place, "TZ", "TST-5:30"};
    P<CTextStream> stream = make<CTextStream>();
    P<CTextFileLog> log = make<CTextFileLog>(P<IOutStream>(stream), false);
};

TEST_F(TextFileLog, Line_HasItsExactForm) {
    const std::pair<SLogMessage, const char*> cases[] = {
        {{kLogTrace, nullptr, "a"_s, {}, kTime}, "07:16:40 trace - a\n"},
        {{kLogInfo, "x"_s, "a"_s, {}, kTime}, "07:16:40 [x] info - a\n"},
        {{kLogWarning, "[x]y]"_s, "a"_s, {}, kTime}, "07:16:40 [[x_y_] Warning - a\n"},
        {{kLogException, nullptr, "a"_s, {}, kTime}, "07:16:40 EXCEPTION - a\n"},
        {{kLogError, nullptr, nullptr, {}, kTime}, "07:16:40 ERROR - \n"},
        {{6, nullptr, "a"_s, {}, kTime}, "07:16:40 UnknownLogLevel - a\n"},
        {{kLogInfo, nullptr, "a\nb\r\nc\rd"_s, {}, kTime},
         "07:16:40 info - a\n                b\n                c\n                d\n"},
        {{kLogInfo, nullptr, "a\n\nb"_s, {}, kTime},
         "07:16:40 info - a\n                \n                b\n"},
        {{kLogInfo, nullptr, "a"_s, {"b"_s, "c\nd"_s}, kTime},
         "07:16:40 info - a\n                b\n                c\n                d\n"},
        {{kLogInfo, nullptr, "a"_s, {}, -1001}, "05:29:58 info - a\n"},
        {{kLogInfo, nullptr, P<IString>(make<CUTF16String>(u"\u00e4\u20ac")), {}, kTime},
         "07:16:40 info - \xc3\xa4\xe2\x82\xac\n"},
        // Names must not control a terminal; what strings cannot decode is still text.
        {{kLogInfo, "a\nb\x1B"_s, "\x1B[2J\ta\x7F\x9B\0"_s, {}, kTime},
         "07:16:40 [a b\\x1B] info - \\x1B[2J\ta\\x7F\\x9B\\x00\n"},
        {{kLogInfo, nullptr, P<IString>(make<CUTF8String>("\xF0\x9F\x98\x80\xFF")), {}, kTime},
         "07:16:40 info - \xF0\x9F\x98\x80\\xFF\n"},
        // Indented by characters, not bytes.
        {{kLogInfo, CString::fromUTF8("\xc3\xa4"), "a\nb"_s, {}, kTime},
         "07:16:40 [\xc3\xa4] info - a\n                    b\n"},
    };
    for (const auto& [message, expected] : cases) EXPECT_EQ(written(message), expected);
}

TEST_F(TextFileLog, LevelBelowTheMinimum_IsNotWritten) {
    const std::tuple<int32_t, int32_t, bool> cases[] = {{3, 4, true},   {4, 4, true},  {5, 6, true},
                                                        {-1, -1, true}, {5, 4, false}, {7, 6, false},
                                                        {0, -1, false}};
    for (const auto& [minimum, level, isShown] : cases) {
        log->setMinimumLevel(minimum);
        EXPECT_NE(written(level).empty(), isShown) << level;
    }
    log->setEnabled(false);
    EXPECT_EQ(written(kLogError), "");
    log->setMinimumLevel(kLogTrace);
    EXPECT_EQ(written(kLogError), "") << "a level does not enable it";
}

TEST_F(TextFileLog, Areas_IndentAndComeBackToZero) {
    {
        CLogArea outer(log, "outer"_s);
        CLogArea inner(log, "inner"_s);
        log->info(nullptr, "x");
    }
    log->leaveArea("never entered"_s);
    log->info(nullptr, "y");
    EXPECT_EQ(withoutTimes(written()), "T trace - [Enter] - outer\n"
                                       "T trace   - [Enter] - inner\n"
                                       "T info     - x\n"
                                       "T trace   - [Leave] - inner\n"
                                       "T trace - [Leave] - outer\n"
                                       "T trace - [Leave] - never entered\n"
                                       "T info - y\n");
    // Hidden areas count, too.
    log->setMinimumLevel(kLogInfo);
    stream->reset();
    log->enterArea("a"_s);
    EXPECT_EQ(written(), "");
    EXPECT_EQ(written(kLogInfo), "07:16:40 info   - x\n");
    log->setEnabled(false);
    log->leaveArea("a"_s);
    log->setEnabled(true);
    EXPECT_EQ(written(kLogInfo), "07:16:40 info - x\n");
}

TEST_F(TextFileLog, FailingStream_EndsTheCallAndLeavesTheLogUsable) {
    const auto fail = [] { throw CStreamError("disk full", nullptr); };
    stream->onWrite = fail;
    EXPECT_THROW(log->info(nullptr, "x"), CStreamError);
    EXPECT_THROW(log->enterArea("a"_s), CStreamError);
    stream->onWrite = nullptr;
    log->info(nullptr, "y");
    EXPECT_EQ(withoutTimes(written()), "T info - y\n");
    CLogArea area(log, "a"_s); // whose end must not throw
    stream->onWrite = fail;
}

TEST_F(TextFileLog, File_IsAppendedToAndFlushed) {
    tests::CTempFolder folder;
    const P<IURI> file = tests::toURI(folder / "a.log");
    for (const char* line : {"first", "second"}) make<CTextFileLog>(file, true)->info(nullptr, line);
    EXPECT_EQ(withoutTimes(tests::readFile(folder / "a.log")), "T info - first\nT info - second\n");
    EXPECT_THROW(make<CTextFileLog>(tests::toURI(folder / "no/a.log"), true), CFileError);
    auto careful = make<CTextFileLog>(P<IOutStream>(stream), true);
    careful->info(nullptr, "x\ny");
    log->info(nullptr, "z");
    EXPECT_EQ(stream->flushes, 1);
}

TEST_F(TextFileLog, EveryOperation_WaitsForARunningWrite) {
    tests::CRivals rivals;
    stream->onWrite = [&] {
        stream->onWrite = nullptr;
        rivals.expectBlocked({[&] { log->info(nullptr, "y"); }, [&] { log->enterArea("a"_s); },
                              [&] { log->leaveArea("a"_s); }});
    };
    log->info(nullptr, "x");
}

class LogManager : public testing::Test {
protected:
    P<CMemoryLog> addLog(const std::string& name, const P<IString>& source) {
        auto log = make<CMemoryLog>(journal, name.empty() ? name : name + ":");
        manager->addLog(log, source);
        return log;
    }
    Journal journal;
    P<CLogManager> manager = make<CLogManager>();
};

TEST_F(LogManager, SinksOfTheSource_ComeFirstInTheirOrder) {
    addLog("all", nullptr);
    addLog("one", "drive"_s);
    addLog("two", "drive"_s);
    addLog("other", "codec"_s);
    addLog("every", ""_s);
    // The source's name may come in any encoding.
    manager->write({kLogWarning, P<IString>(make<CUTF16String>(u"drive")), "x"_s, {"y"_s}, 7});
    EXPECT_EQ(journal, (Journal{"one:3 drive x|y@7", "two:3 drive x|y@7", "all:3 drive x|y@7",
                                "every:3 drive x|y@7"}));
    journal.clear();
    manager->info(nullptr, "z");
    EXPECT_EQ(journal, (Journal{"all:2  z@-1", "every:2  z@-1"}));
}

TEST_F(LogManager, EveryKind_HasItsLevel) {
    addLog("", nullptr);
    for (const int32_t least : {0, 3}) {
        manager->setMinimumLevel(least);
        EXPECT_EQ(manager->getMinimumLevel(), least);
        manager->trace(nullptr, "a");
        manager->debug(nullptr, "b");
        manager->addInfo("name"_s, "value"_s);
        manager->endFeature("f"_s);
    }
    EXPECT_EQ(journal,
              (Journal{"0  a@-1", "1  b@-1", "2  Add Info: name = value@-1", "2  End Feature: f@-1"}));
}

TEST_F(LogManager, Threshold_HoldsBeforeTheSinks) {
    auto log = addLog("", nullptr);
    manager->enterArea("known"_s);
    manager->setMinimumLevel(kLogWarning);
    manager->info(nullptr, "a");
    manager->enterArea("area"_s);
    manager->startFeature("f"_s);
    manager->leaveArea("area"_s);
    manager->leaveArea("known"_s); // passed on, since the sink has entered it
    manager->warning(nullptr, "b");
    log->setMinimumLevel(kLogError);
    manager->warning(nullptr, "c");
    manager->setEnabled(false);
    manager->error(nullptr, "d");
    manager->setEnabled(true);
    manager->error(nullptr, "e");
    EXPECT_EQ(journal, (Journal{"enter known", "leave known", "3  b@-1", "5  e@-1"}));
}

TEST_F(LogManager, AnotherManager_ServesAsSinkAndLeavesByIdentity) {
    auto host = make<CLogManager>();
    host->addLog(make<CMemoryLog>(journal), nullptr);
    // As a host passes it: added as a manager, removed through another handle to the same object.
    P<ILogManager> added = host;
    manager->addLog(P<ILog>(added), ""_s);
    manager->logException("s"_s, CError("text", "title"));
    EXPECT_EQ(journal, (Journal{"4 s Type: title\nText: text@-1"}));
    EXPECT_FALSE(manager->removeLog(P<ILog>(host), "s"_s));
    EXPECT_TRUE(manager->removeLog(P<ILog>(host), nullptr));
    EXPECT_FALSE(manager->removeLog(P<ILog>(host), nullptr));
    manager->info(nullptr, "x");
    EXPECT_EQ(journal.size(), 1u);
    EXPECT_THROW(manager->addLog(P<ILog>(manager), nullptr), CInvalidArgError)
        << "it would call itself for ever";
    EXPECT_THROW(manager->addLog(nullptr, nullptr), CInvalidArgError);
}

TEST_F(LogManager, ThrowingSink_EndsTheCallAndKeepsAreasBalanced) {
    addLog("1", nullptr);
    auto bad = addLog("bad", nullptr);
    addLog("3", nullptr);
    bad->onCall = [] { throw CError("full"); };
    EXPECT_THROW(manager->info(nullptr, "x"), CError);
    EXPECT_THROW(CLogArea(manager, "a"_s), CError);
    EXPECT_EQ(journal, (Journal{"1:2  x@-1", "1:enter a", "1:leave a"}));
    journal.clear();
    bad->onCall = nullptr;
    manager->enterArea("b"_s);
    manager->leaveArea("a"_s);
    bad->onCall = [] { throw CError("full"); };
    EXPECT_THROW(manager->leaveArea("b"_s), CError);
    EXPECT_EQ(journal, (Journal{"1:enter b", "bad:enter b", "3:enter b", "1:leave b", "3:leave b"}));
}

TEST_F(LogManager, SinksThatComeAndGoDuringACall_LeaveTheOthersAlone) {
    for (const char* source : {"s", ""}) {
        journal.clear();
        P<CMemoryLog> first = addLog("1", newString(source));
        P<CMemoryLog> second = addLog("2", newString(source));
        addLog("3", newString(source));
        P<CMemoryLog> late;
        first->onCall = [&] {
            EXPECT_TRUE(manager->removeLog(first, newString(source)));
            EXPECT_TRUE(manager->removeLog(second, newString(source)));
            late = addLog("late", newString(source));
        };
        for (const char* line : {"x", "y"}) manager->info("s"_s, line);
        EXPECT_EQ(journal, (Journal{"1:2 s x@-1", "3:2 s x@-1", "3:2 s y@-1", "late:2 s y@-1"}));
        first->onCall = nullptr;
        manager = make<CLogManager>();
    }
    P<CMemoryLog> last = addLog("last", "s"_s);
    last->onCall = [&] { manager->removeLog(last, "s"_s); };
    manager->info("s"_s, "x");
    EXPECT_EQ(manager->getSourceCount(), 0u);
    last->onCall = nullptr;
}

TEST_F(LogManager, EveryOperation_WaitsForARunningCall) {
    P<CMemoryLog> log = addLog("", nullptr);
    tests::CRivals rivals;
    log->onCall = [&] {
        log->onCall = nullptr;
        rivals.expectBlocked({[&] { manager->addLog(log, "s"_s); }, [&] { manager->removeLog(log, "s"_s); },
                              [&] { manager->error(nullptr, "x"); }, [&] { manager->enterArea("a"_s); }});
    };
    manager->info(nullptr, "x");
}

std::string trace(const char* file, int line, const char* comment) {
    testing::internal::CaptureStderr();
    zvrTrace(file, line, comment);
    return testing::internal::GetCapturedStderr();
}

TEST(DebugTrace, IsCutToItsBufferAndHasNoControls) {
    std::string wide;
    for (int i = 0; i < 3000; ++i) wide += "\xe2\x82\xac";
    const std::string head = "zvr_trace: f (1) c=";
    std::string line = trace("f", 1, wide.c_str());
    EXPECT_EQ(line, head + wide.substr(0, 3 * (1023 - head.size()))) << "1023 whole characters";
    EXPECT_EQ(trace("f", 1, std::string(5000, '\x80').c_str()).substr(0, head.size()), head);
    EXPECT_EQ(trace("a.cpp", 12, nullptr), "zvr_trace: a.cpp (12)\n");
    EXPECT_EQ(trace("a.cpp", 1, "\x1B[2J \xC2\x9B\xC2\x80 \xC3\x9B"),
              "zvr_trace: a.cpp (1) c=?[2J ???? \xC3\x9B\n");
}

} // namespace
