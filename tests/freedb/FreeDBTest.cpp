#include "freedb/CddbServer.h"
#include "freedb/FreeDBInfoRetriever.h"
#include "peru/net/ScriptedServer.h"
#include "support/PeruLogLines.h"
#include "support/TempFolder.h"

#include <filesystem>
#include <random>

#ifdef HAVE_CDDB
#include <cddb/cddb.h>
#endif

namespace {

using namespace freedb;
using peru::make;
using tests::CPeer;
using tests::CScriptedServer;
using tests::errorOf;
using tests::text;

struct SDisc {
    std::vector<int32_t> offsets;
    int32_t leadOut;
    uint32_t id;
};

const SDisc kDiscs[] = {
    {{150}, 13650, 0x0200b401},
    {{150, 17827, 33215, 50640, 67577, 84975, 102092, 122040, 139720, 158045, 172832, 189270},
     207105,
     0x870ac70c},
    {{183, 18000, 36049, 54999}, 70000, 0x2103a304},
    {{2400, 20000, 41000}, 60030, 0x22030003},
    {{182, 10000}, 20000, 0x09010802},
};

P<CFreeDBDiscInfo> toInfo(const SDisc& disc) {
    return CFreeDBDiscInfo::fromOffsets(disc.offsets, disc.leadOut);
}

SFreeDBSettings makeSettings(int port) {
    SFreeDBSettings settings;
    settings.host = "127.0.0.1";
    settings.port = port;
    settings.clientName = "test client";
    settings.clientVersion = "1.0";
    settings.proxy = "";
    return settings;
}

void drive(CFreeDBCommand& command, bool wait) {
    while (!command.advance(wait)) std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

// The outcome of a command in one text.
std::string describe(const CFreeDBCommand& command) {
    const std::string result = std::to_string(static_cast<int>(command.getResult()));
    return command.getErrorMessage()->isEmpty() ? result : result + " " + text(command.getErrorMessage());
}
std::string describe(const std::vector<P<CFreeDBDiscDesc>>& candidates) {
    std::string all;
    for (const auto& each : candidates)
        all += "[" + text(each->getCategory()) + " " + std::to_string(each->getDiscId()) + " " +
               text(each->getTitle()) + "]";
    return all;
}
std::string describe(const P<CAudioCDInfo>& info) {
    if (!info) return "";
    std::string all = text(info->artist) + "|" + text(info->title) + "|" + text(info->year) + "|" +
                      text(info->genre) + "|" + text(info->extended);
    for (const auto& track : info->tracks)
        all += "\n" + text(track->artist) + "|" + text(track->title) + "|" + text(track->extended);
    return all;
}

// Serves one reply to every request.
struct SReplyServer {
    explicit SReplyServer(const std::string& reply, const std::string& head = "HTTP/1.1 200 OK\r\n")
        : server([this, reply, head](CPeer& peer) {
              request = peer.receive();
              ++count;
              peer.send(head + "\r\n" + reply);
          }) {}
    std::string request;
    std::atomic<int> count = 0;
    CScriptedServer server;
};

const std::string kInvalid = "-1 The server returned an invalid reply.";

TEST(Cddb, DiscIds) {
    for (const SDisc& disc : kDiscs) EXPECT_EQ(toInfo(disc)->getDiscId(), disc.id);
    EXPECT_EQ(toInfo(kDiscs[0])->getTotalSeconds(), 180);
    // The first track of this disc has a pre-gap of its own.
    const CFreeDBDiscInfo own({{0, 17817, 183}, {17850, 18049, 0}, {35899, 18950, 0}, {54849, 15001, 0}});
    EXPECT_EQ(own.getOffsets(), kDiscs[2].offsets);
    EXPECT_EQ(own.getDiscId(), kDiscs[2].id);
    // 38 tracks whose digits add up to 255.
    std::vector<int32_t> offsets;
    for (int32_t i = 0, sum = 0; sum < 255; ++i) {
        int32_t digits = 0;
        for (int32_t n = i; n > 0; n /= 10) digits += n % 10;
        if (sum + digits > 255) continue;
        sum += digits;
        offsets.push_back(i * 75);
    }
    EXPECT_EQ(CFreeDBDiscInfo::fromOffsets(offsets, offsets.back() + 75)->getDiscId() >> 24, 0u);
    for (const SDisc& bad :
         {SDisc{{}, 100, 0}, {{150, 150}, 300, 0}, {{150}, 150, 0}, {{-1}, 5, 0}, {{150}, INT32_MIN, 0}})
        EXPECT_THROW(toInfo(bad), peru::CInvalidArgError);
    // As many tracks, and as late an end, as there can be.
    constexpr int32_t kLongest = INT32_MAX - 98 - 150;
    for (const auto& [count, length, valid] : {std::tuple(99, 1, true),
                                               {100, 1, false},
                                               {99, 0, false},
                                               {99, kLongest, true},
                                               {99, kLongest + 1, false}}) {
        std::vector<CFreeDBDiscInfo::STrack> tracks;
        for (int32_t i = 0; i < count; ++i) tracks.push_back({i, length, 0});
        if (valid)
            EXPECT_EQ(make<CFreeDBDiscInfo>(tracks)->getDiscId() & 0xff, 99u);
        else
            EXPECT_THROW(make<CFreeDBDiscInfo>(tracks), peru::CInvalidArgError);
    }
}

TEST(Cddb, Requests) {
    const SReplyServer proxy("202 none\r\n");
    SFreeDBSettings settings = makeSettings(80);
    settings.host = "cddb.example.org";
    settings.proxy = proxy.server.getBase();
    settings.noProxy = "<local>";
    const P<CFreeDBCommand> query = make<CFreeDBQueryCommand>(settings, *toInfo(kDiscs[2]));
    drive(*query, true);
    const std::string body = "cmd=cddb+query+2103a304+4+183+18000+36049+54999+930"
                             "&hello=anon+anon+test_client+1.0&proto=6";
    const auto expect = [](const std::string& target, const std::string& host, const std::string& form) {
        return "POST " + target + " HTTP/1.1\r\nHost: " + host +
               "\r\nContent-Type: application/x-www-form-urlencoded\r\nConnection: close\r\n"
               "Content-Length: " +
               std::to_string(form.size()) + "\r\n\r\n" + form;
    };
    EXPECT_EQ(proxy.request,
              expect("http://cddb.example.org:80/~cddb/cddb.cgi", "cddb.example.org:80", body));
    for (const char* host : {"::1", "[::1]"}) {
        settings.host = host;
        drive(*make<CFreeDBQueryCommand>(settings, *toInfo(kDiscs[2])), true);
        EXPECT_EQ(proxy.request, expect("http://[::1]:80/~cddb/cddb.cgi", "[::1]:80", body));
    }

    const SReplyServer server("401 none\r\n");
    settings = makeSettings(server.server.getPort());
    settings.proxy = proxy.server.getBase();
    settings.noProxy = "127.0.0.1";
    settings.path = "other";
    settings.user = "a b";
    settings.userHost = "c&d";
    const P<CFreeDBCommand> read = make<CFreeDBReadCommand>(
        settings, CFreeDBDiscDesc(peru::CString::fromUTF8("a+b"), 0x0200b401, peru::CString::empty()));
    drive(*read, true);
    const std::string address = "127.0.0.1:" + std::to_string(server.server.getPort());
    EXPECT_EQ(server.request, expect("/other", address,
                                     "cmd=cddb+read+a%2Bb+0200b401&hello=a_b+c%26d+test_client+1.0&proto=6"));
    for (const auto change :
         {+[](SFreeDBSettings& s) { s.host = ""; }, +[](SFreeDBSettings& s) { s.host = "a/b"; },
          +[](SFreeDBSettings& s) { s.port = 0x10000; }, +[](SFreeDBSettings& s) { s.port = 0; },
          +[](SFreeDBSettings& s) { s.clientName = ""; },
          +[](SFreeDBSettings& s) { s.clientVersion = ""; }}) {
        SFreeDBSettings bad = settings;
        change(bad);
        EXPECT_THROW(CFreeDBQueryCommand(bad, *toInfo(kDiscs[0])), peru::CException);
    }
}

TEST(Cddb, QueryReplies) {
    const std::string nul("200 rock 1 A\0B\r\n", 17);
    const struct {
        std::string reply;
        std::string outcome;
        std::string candidates = "";
    } cases[] = {
        {"200 rock 870ac70c A / B \r\n", "2", "[rock 2265630476 A / B ]"},
        {"202 No match\n", "1"},
        {"210 Found\r\nrock 1 A / B\r\nmisc FF C\r\n.\r\nrest", "2", "[rock 1 A / B][misc 255 C]"},
        {"210 Found\nrock 1 A / B", "2", "[rock 1 A / B]"},
        {"210 Found\n.\n", "1"},
        {"211 close\nrock 1 A\n.", "3", "[rock 1 A]"},
        {"211 close\nrock 1\n.", kInvalid},
        {"211 close\nrock xyz A\n.", kInvalid},
        {"210 Found\n\n.", kInvalid},
        {"210 Found\n" + std::string(2'000'000, '\n'), kInvalid},
        {"200 \r\n", kInvalid},
        {"201 OK\r\n", kInvalid},
        {"2", kInvalid},
        {"2000 rock 1 A", kInvalid},
        {"<html>", kInvalid},
        {"abc rock", "-1 The resultcode could not be parsed: (Messgae abc)."},
        {"403 corrupt", "-1 The server returned an error message (code 403)."},
        {"530 busy", "-1 The server returned an error message (code 530)."},
        {"", "-1 The server returned an empty message"},
        {nul, "2", "[rock 1 A B]"},
        {std::string(9, '\0'), kInvalid},
        {"200 misc 1 Bj\xf6rk \x93\x94\r\n", "2", "[misc 1 Björk “”]"},
        {"200 misc 1 Bj\xc3\xb6rk\r\n", "2", "[misc 1 Björk]"},
    };
    for (const auto& each : cases)
        for (const bool wait : {true, false}) {
            const SReplyServer server(each.reply);
            const P<CFreeDBQueryCommand> query =
                make<CFreeDBQueryCommand>(makeSettings(server.server.getPort()), *toInfo(kDiscs[1]));
            drive(*query, wait);
            EXPECT_TRUE(query->advance(wait));
            EXPECT_EQ(server.count, 1) << "finished commands ask no more";
            const std::string shown = each.reply.substr(0, 60);
            EXPECT_EQ(describe(*query), each.outcome) << shown;
            EXPECT_EQ(describe(query->getCandidates()), each.candidates) << shown;
        }
}

TEST(Cddb, Records) {
    const struct {
        std::string reply;
        std::string record; // empty for an invalid one
        const char* charset = "";
    } cases[] = {
        {"210 rock 1 follows\r\n# DTITLE=no\r\nDTITLE = A / B \r\nDYEAR=1999\r\nDGENRE=\tFolk\r\n"
         "TTITLE1=Two\r\nTTITLE0=One\r\nFURTHER=x\r\nnothing\r\n.\r\nDGENRE=late",
         "A|B|1999|Folk|\n|One|\n|Two|"},
        {"210\nDTITLE=No artist", "|No artist|||"},
        {"210 x\nDTITLE=A / B / C\nTTITLE0=over \nTTITLE0=two lines\nTTITLE0=, or three\nTTITLE2=3\n",
         "A|B / C|||\n|over two lines, or three|\n||\n|3|"},
        {"210 x\nDTITLE=A\nDTITLE= / B\xc3\nDTITLE=\xb6\nEXTD=one\\ntwo\\\\n\nEXTT0=x\\ty\nTTITLE0=a\\nb\n",
         "A|Bö|||one\ntwo\\n\n|a b|x\ty"},
        {"210 x\nDTITLE=Various / B\nTTITLE0=X / One\nTTITLE1=Two", "Various|B|||\nX|One|\n|Two|"},
        {"210 x\nDTITLE=Duo / B\nTTITLE0=X / One\nTTITLE1=Y / Two", "Duo|B|||\nX|One|\nY|Two|"},
        {"210 x\nDTITLE=Duo / B\nTTITLE0=X / One\nTTITLE1=Two", "Duo|B|||\n|X / One|\n|Two|"},
        {"210 x\nTTITLE0=a\nTTITLE99=b\nTTITLE-1=c\nTTITLEx=d\nTTITLE=e", "||||\n|a|"},
        {"210 x\nTTITLE0=\xcd\xe0\xf2\xe0\xeb\xfc\xff\nDTITLE=caf\xc3\xa9", "|café|||\n|Наталья|",
         "windows-1251"},
        {"210 x\nTTITLE0=\x83\x65\x83\x58\x83\x67", "||||\n|テスト|", "Shift_JIS"},
        {"210 x\nTTITLE0=\xe9", "||||\n|é|", "no-such-charset"},
        {std::string("210 x\nTTITLE0=\x80\x81\0\x8d", 19), "||||\n|\xc2\x80\xc2\x81 \xc2\x8d|", "ISO-8859-1"},
        {"210 x\nDYEAR=1999\nEXTT0=y\n.", ""},
        {"210 x\n", ""},
        {"200 x\nDTITLE=y", ""},
        {"210 x\nTTITLE0=" + std::string(10'000'000, 'x'), "||||\n|" + std::string(10'000'000, 'x') + "|"},
    };
    for (const auto& each : cases) {
        const SReplyServer server(
            each.reply,
            std::string("HTTP/1.1 200 OK\r\nContent-Type: text/plain;x; format=flowed ; CHARSET=\"") +
                each.charset + "\"\r\n");
        const P<CFreeDBReadCommand> read = make<CFreeDBReadCommand>(
            makeSettings(server.server.getPort()),
            CFreeDBDiscDesc(peru::CString::fromUTF8("rock"), 1, peru::CString::empty()));
        drive(*read, true);
        EXPECT_TRUE(describe(read->getInfo()) == each.record)
            << each.reply.substr(0, 60) << ": " << describe(read->getInfo()).substr(0, 100);
        EXPECT_EQ(describe(*read), each.record.empty() ? kInvalid : "2");
    }
}

TEST(Cddb, TitlesOfVariousArtistsNameThem) {
    for (const std::string name : {"VARIOUS", "Various Artists", "various artist", "Va", "v.A.", "V/A", "AZ"})
        EXPECT_EQ(
            describe(parseReadReply("210 x\nDTITLE=" + name + " / B\nTTITLE0=X / One", CTextDecoder({}, {}))),
            name + "|B|||\n" + (name == "AZ" ? "|X / One|" : "X|One|"));
}

TEST(Cddb, FailuresOfTheConnection) {
    const auto query = [](const SFreeDBSettings& settings) {
        const P<CFreeDBCommand> command = make<CFreeDBQueryCommand>(settings, *toInfo(kDiscs[0]));
        drive(*command, true);
        return describe(*command);
    };
    int port = 0;
    {
        const CScriptedServer gone([](CPeer&) {});
        port = gone.getPort();
    }
    const std::string notLocated = "-1 The internet music database server could not be located.";
    EXPECT_EQ(query(makeSettings(port)), notLocated);
    SFreeDBSettings unknown = makeSettings(port);
    unknown.host = "name.invalid";
    const peru::P<tests::CPeruLogLines> lines = make<tests::CPeruLogLines>();
    peru::getLogManager()->addLog(lines, peru::CString::empty());
    EXPECT_EQ(query(unknown), notLocated);
    EXPECT_FALSE(lines->take().empty()) << "the reason";
    const SReplyServer useless("useless");
    EXPECT_EQ(query(makeSettings(useless.server.getPort())), kInvalid);
    EXPECT_EQ(lines->take().back(), "Received invalid reply from server: useless");
    peru::getLogManager()->removeLog(lines, peru::CString::empty());
    const SReplyServer failing("x", "HTTP/1.1 404 Not Found\r\n");
    EXPECT_EQ(query(makeSettings(failing.server.getPort())),
              "-1 The freedb server has answered with an HTTP error response (HTTP error 404 (Not Found)).");
    const CScriptedServer resetting([](CPeer& peer) {
        peer.receive();
        peer.reset();
    });
    EXPECT_EQ(query(makeSettings(resetting.getPort())),
              "-1 The connection was closed by the remote host (code=104).");
    const SReplyServer large(std::string(1'000'000, ' '));
    SFreeDBSettings limited = makeSettings(large.server.getPort());
    limited.maxReplySize = 1000;
    EXPECT_NE(query(limited).find("is larger than permitted"), std::string::npos);

    const CScriptedServer silent([](CPeer& peer) { peer.waitForClose(); });
    const P<CFreeDBCommand> command =
        make<CFreeDBQueryCommand>(makeSettings(silent.getPort()), *toInfo(kDiscs[0]));
    EXPECT_FALSE(command->advance(false));
    std::thread canceller([&] { command->cancel(); });
    drive(*command, true);
    canceller.join();
    EXPECT_EQ(describe(*command), "-1 The operation has been aborted");
    CFreeDBInfoRetriever waiting(makeSettings(silent.getPort()), {toInfo(kDiscs[0])}, nullptr);
    EXPECT_FALSE(waiting.advance(false));
    waiting.cancel();
    EXPECT_TRUE(waiting.advance(true));
    EXPECT_EQ(text(waiting.getErrorMessage()), "The operation has been aborted");
}

class CHandler : public peru::CObject, public IFreeDBHandler {
public:
    explicit CHandler(std::optional<size_t> choice) : m_choice(choice) {}
    std::optional<size_t> chooseDisc(const std::vector<P<CFreeDBDiscDesc>>& candidates,
                                     bool isExact) override {
        offered = describe(candidates) + (isExact ? "exact" : "");
        return m_choice;
    }
    std::string offered;

private:
    std::optional<size_t> m_choice;
};

TEST(Cddb, RetrieverAgainstAServer) {
    const tests::CCddbServer server;
    const SFreeDBSettings settings = makeSettings(server.getPort());
    const auto retrieve = [&](std::vector<P<CFreeDBDiscInfo>> discs, const P<IFreeDBHandler>& handler,
                              bool wait = true) {
        const P<CFreeDBInfoRetriever> retriever = make<CFreeDBInfoRetriever>(settings, discs, handler);
        while (!retriever->advance(wait)) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        EXPECT_EQ(retriever->getState(), EFreeDBState::finished);
        return retriever;
    };
    for (const bool wait : {true, false}) {
        const auto found = retrieve({toInfo(kDiscs[1])}, nullptr, wait);
        EXPECT_EQ(describe(found->getInfo())
                      .find("The Tones|Twelve Pieces|1999|Rock|Recorded in \\\"one\\\" week\nin winter\n"
                            "|Stück 1|live\n|Stück 2|\n"),
                  0u);
    }
    EXPECT_EQ(describe(retrieve({toInfo(kDiscs[4])}, nullptr)->getInfo()),
              "Björk|Café|||\n|“Quoted”|\n|Naïve|");
    EXPECT_EQ(retrieve({toInfo(kDiscs[0])}, nullptr)->getOutcome(), EFreeDBOutcome::noMatch);

    const P<CHandler> second = make<CHandler>(1);
    EXPECT_EQ(describe(retrieve({toInfo(kDiscs[2])}, second)->getInfo()),
              "Various|Other|||\nX|First|\nY|Second|\nZ|Third|\n|Fourth|");
    EXPECT_EQ(second->offered, "[rock 553886468 A / One][misc 553886468 A / Other]exact");
    const P<CHandler> none = make<CHandler>(std::nullopt);
    EXPECT_EQ(retrieve({toInfo(kDiscs[3])}, none)->getOutcome(), EFreeDBOutcome::notChosen);
    EXPECT_EQ(none->offered, "[jazz 570622211 B / Near][folk 2265630476 B / Nearer]");
    EXPECT_EQ(errorOf<peru::CError>([&] { retrieve({toInfo(kDiscs[3])}, nullptr); }),
              "No Handler defindes but needed");
    const auto missing = retrieve({toInfo(kDiscs[3])}, make<CHandler>(1));
    EXPECT_EQ(missing->getOutcome(), EFreeDBOutcome::failed);
    EXPECT_EQ(text(missing->getErrorMessage()), "The server returned an error message (code 401).");

    // A failed query is repeated with the next table of contents.
    std::atomic<int> count = 0;
    const CScriptedServer failing([&](CPeer& peer) {
        peer.receive();
        peer.send(std::string("HTTP/1.1 200 OK\r\n\r\n") + (count++ == 0 ? "530 busy" : "202 none"));
    });
    CFreeDBInfoRetriever twice(makeSettings(failing.getPort()), {toInfo(kDiscs[0]), toInfo(kDiscs[1])},
                               nullptr);
    EXPECT_TRUE(twice.advance(true));
    EXPECT_EQ(twice.getAttemptCount(), 2u);
    EXPECT_EQ(twice.getOutcome(), EFreeDBOutcome::noMatch);
    CFreeDBInfoRetriever nowhere({}, {toInfo(kDiscs[0])}, nullptr);
    for (int i = 0; i < 3; ++i) EXPECT_THROW(nowhere.advance(true), peru::CInvalidArgError);
    CFreeDBInfoRetriever cancelled(settings, {toInfo(kDiscs[0]), toInfo(kDiscs[1])}, nullptr);
    cancelled.cancel();
    EXPECT_TRUE(cancelled.advance(true));
    EXPECT_EQ(cancelled.getAttemptCount(), 1u);
    EXPECT_EQ(text(cancelled.getErrorMessage()), "The operation has been aborted");

#ifdef HAVE_CDDB
    std::mt19937 random(4);
    for (int i = 0; i < 200; ++i) {
        SDisc disc{{static_cast<int32_t>(random() % 3000)}, 0, 0};
        for (size_t tracks = random() % 98; tracks > 0; --tracks)
            disc.offsets.push_back(disc.offsets.back() + 1 + static_cast<int32_t>(random() % 30000));
        disc.leadOut = disc.offsets.back() + 1 + static_cast<int32_t>(random() % 30000);
        cddb_disc_t* const peer = cddb_disc_new();
        for (const int32_t offset : disc.offsets) {
            cddb_track_t* const track = cddb_track_new();
            cddb_track_set_frame_offset(track, offset);
            cddb_disc_add_track(peer, track);
        }
        cddb_disc_set_length(peer, static_cast<unsigned>(disc.leadOut / 75));
        ASSERT_EQ(cddb_disc_calc_discid(peer), 1);
        EXPECT_EQ(cddb_disc_get_discid(peer), toInfo(disc)->getDiscId());
        cddb_disc_destroy(peer);
    }
    libcddb_shutdown();
#endif
}

TEST(Cddb, Cache) {
    const tests::CTempFolder folder;
    const SReplyServer server("200 rock 1 A / B\r\n");
    SFreeDBSettings settings = makeSettings(server.server.getPort());
    settings.cacheFolder = folder / "new/cache";
    const auto query = [&](const SDisc& disc = kDiscs[1]) {
        const P<CFreeDBQueryCommand> command = make<CFreeDBQueryCommand>(settings, *toInfo(disc));
        drive(*command, true);
        return describe(*command) + describe(command->getCandidates());
    };
    const std::string found = "2[rock 1 A / B]";
    EXPECT_EQ(query(), found);
    EXPECT_EQ(query(), found);
    EXPECT_EQ(server.count, 1);
    // The same id with other offsets is another disc.
    SDisc similar = kDiscs[1];
    ++similar.offsets[1];
    ASSERT_EQ(toInfo(similar)->getDiscId(), kDiscs[1].id);
    EXPECT_EQ(query(similar), found);
    EXPECT_EQ(server.count, 2);
    settings.refreshCache = true;
    EXPECT_EQ(query(), found);
    settings.refreshCache = false;
    EXPECT_EQ(server.count, 3);

    // An entry that is cut off or has a wrong byte anywhere does not count, and is replaced.
    std::filesystem::remove_all(settings.cacheFolder);
    query();
    const std::filesystem::path entry = std::filesystem::directory_iterator(settings.cacheFolder)->path();
    const std::string whole = tests::readFile(entry);
    int requests = server.count;
    for (size_t i = 0; i < whole.size(); i += 17) {
        std::string damaged = whole;
        damaged[i] ^= 1;
        for (const std::string& bytes : {damaged, whole.substr(0, i)}) {
            folder.write("new/cache/" + entry.filename().string(), bytes);
            EXPECT_EQ(query(), found);
            EXPECT_EQ(server.count, ++requests) << i;
            EXPECT_EQ(tests::readFile(entry), whole);
        }
    }
    EXPECT_EQ(tests::countEntries(settings.cacheFolder), 1u);

    // Neither "no match" nor a failure is stored; a cache that cannot be written does no harm.
    const SReplyServer other("202 none");
    settings.port = other.server.getPort();
    EXPECT_EQ(query() + query(), "11");
    EXPECT_EQ(other.count, 2);
    settings.port = server.server.getPort();
    settings.cacheFolder = "/dev/null/cache";
    EXPECT_EQ(query(), found);
}

} // namespace
