// Look-ups of discs and downloads through the C interface.
#include "HostSupport.h"
#include "freedb/CddbServer.h"
#include "peru/net/ScriptedServer.h"

#include <thread>

using namespace tests;

namespace {

const std::vector<int32_t> kSeveral = {183, 18000, 36049, 54999};

class HostNetwork : public CHostTest {
protected:
    static int32_t query(TONEWRIGHT_Handle cddb) {
        return TONEWRIGHT_Host_QueryCDDB(cddb, kSeveral.data(), 4, 70000);
    }

    CEnvironment direct{"http_proxy", ""};
    CEnvironment cache{"XDG_CACHE_HOME", folder.path().string()};
};

} // namespace

TEST_F(HostNetwork, Cddb) {
    uint32_t id = 1;
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBDiscId(kSeveral.data(), 4, 60, &id), 0);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBDiscId(kSeveral.data(), 0, 60, &id), 0);
    EXPECT_EQ(id, 1u);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBDiscId(kSeveral.data(), 4, 70000, &id), 1);
    EXPECT_EQ(id, 0x2103a304u);

    const CCddbServer server;
    auto settings = makeRecord<TONEWRIGHT_CDDBSettings>();
    EXPECT_EQ(TONEWRIGHT_Host_CreateCDDB(&settings), nullptr);
    settings.host = "127.0.0.1";
    settings.port = server.getPort();
    settings.clientName = "test";
    EXPECT_EQ(TONEWRIGHT_Host_CreateCDDB(&settings), nullptr);
    EXPECT_STREQ(lastFailure().message, "A look-up needs the name and the version of the application");
    settings.clientVersion = "1";
    settings.proxy = "127.0.0.1:1";
    settings.noProxy = "127.0.0.1";
    settings.size = offsetof(TONEWRIGHT_CDDBSettings, cacheFolder); // of an older host
    settings.cacheFolder = "/unused";
    const CHandle cddb(TONEWRIGHT_Host_CreateCDDB(&settings));
    EXPECT_EQ(query(cddb), TONEWRIGHT_CDDB_EXACT);
    ASSERT_EQ(TONEWRIGHT_Host_GetCDDBCandidateCount(cddb), 2);
    auto candidate = makeRecord<TONEWRIGHT_CDDBCandidate>();
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBCandidate(cddb, 2, &candidate), 0);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBCandidate(cddb, 1, &candidate), 1);
    EXPECT_STREQ(candidate.category, "misc");
    EXPECT_EQ(candidate.id, id);
    EXPECT_STREQ(candidate.title, "A / Other");
    EXPECT_EQ(TONEWRIGHT_Host_ReadCDDB(cddb, -1), nullptr);
    EXPECT_EQ(TONEWRIGHT_Host_ReadCDDB(cddb, 0), nullptr);
    EXPECT_STREQ(lastFailure().message, "The server returned an error message (code 401).");
    const CHandle record(TONEWRIGHT_Host_ReadCDDB(cddb, 1));
    auto disc = makeRecord<TONEWRIGHT_CDDBRecord>();
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBRecord(record, &disc), 1);
    EXPECT_STREQ(disc.title, "Other");
    EXPECT_EQ(disc.trackCount, 4);
    auto track = makeRecord<TONEWRIGHT_CDDBTrack>();
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBTrack(record, 4, &track), 0);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBTrack(record, 2, &track), 1);
    EXPECT_STREQ(track.artist, "Z");
    EXPECT_STREQ(track.title, "Third");
    EXPECT_EQ(countEntries(folder / "tonewright/cddb"), 2u);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBRecord(cddb, &disc), 0);

    const CScriptedServer silent([](CPeer& peer) { peer.waitForClose(); });
    settings.port = silent.getPort();
    const CHandle waiting(TONEWRIGHT_Host_CreateCDDB(&settings));
    std::thread canceller([&] { TONEWRIGHT_Host_CancelCDDB(waiting); });
    EXPECT_EQ(query(waiting), TONEWRIGHT_CDDB_FAILED);
    canceller.join();
    EXPECT_EQ(query(waiting), TONEWRIGHT_CDDB_FAILED);
    EXPECT_EQ(TONEWRIGHT_Host_GetCDDBCandidateCount(waiting), 0);
}

TEST_F(HostNetwork, Downloads) {
    const CScriptedServer server([](CPeer& peer) {
        const std::string request = peer.receive();
        if (request.find("/silent") != std::string::npos) return peer.waitForClose();
        peer.send("HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\n");
        peer.send(request.find("/short") != std::string::npos ? "hell" : "hello");
    });
    const auto open = [&](const std::string& path) {
        const std::string uri = server.getBase() + path;
        return TONEWRIGHT_Host_CreateDownload(std::u16string(uri.begin(), uri.end()).c_str());
    };
    EXPECT_EQ(TONEWRIGHT_Host_CreateDownload(u"https://host/"), nullptr);
    EXPECT_EQ(TONEWRIGHT_Host_CreateDownload(u"file:///x"), nullptr);
    const std::string file = folder / "file";
    int64_t seen[2] = {};
    const auto report = [](int64_t received, int64_t total, void* user) -> int32_t {
        static_cast<int64_t*>(user)[0] = received;
        static_cast<int64_t*>(user)[1] = total;
        return TONEWRIGHT_CONTINUE;
    };
    const CHandle whole(open("/whole"));
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(whole, file.c_str(), report, seen), 1) << lastFailure().message;
    EXPECT_EQ(seen[0], 5);
    EXPECT_EQ(seen[1], 5);
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(whole, file.c_str(), nullptr, nullptr), 0) << "a second time";
    EXPECT_EQ(readFile(file), "hello");
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(CHandle(open("/short")), file.c_str(), nullptr, nullptr), 0);
    EXPECT_NE(std::string(lastFailure().message).find("Unexpected end of data stream"), std::string::npos);
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(CHandle(open("/whole")), "/dev/full", nullptr, nullptr), 0);
    EXPECT_STREQ(lastFailure().message, "/dev/full cannot be written: No space left on device");
    const auto stop = [](int64_t, int64_t, void*) -> int32_t { return TONEWRIGHT_STOP; };
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(CHandle(open("/whole")), file.c_str(), stop, nullptr), 0);
    const CHandle silent(open("/silent"));
    std::thread canceller([&] { TONEWRIGHT_Host_CancelDownload(silent); });
    EXPECT_EQ(TONEWRIGHT_Host_RunDownload(silent, file.c_str(), nullptr, nullptr), 0);
    canceller.join();
}
