#include "freedb/LazyLibrary.h"
#include "host_support/Guard.h"

#include <vector>

using namespace tonewright::host_support;
using freedb::CAudioCDInfo;
using freedb::SFreeDBSettings;
using peru::CString;

namespace {

std::string toText(const P<peru::IString>& text) {
    return text ? CString::toStdString(text) : std::string();
}

class CLookUp : public peru::CObject {
public:
    struct SCandidate {
        std::string category, title;
    };

    explicit CLookUp(const SFreeDBSettings& settings)
        : client(freedb::getLibrary()->createClient(settings)) {}
    ~CLookUp() override = default;

    void set(freedb::SFreeDBCandidates candidates) {
        found = std::move(candidates);
        texts.clear();
        for (const auto& disc : found.discs)
            texts.push_back({toText(disc->getCategory()), toText(disc->getTitle())});
    }

    const P<freedb::IFreeDBClient> client;
    freedb::SFreeDBCandidates found;
    std::vector<SCandidate> texts; // of the candidates
};

class CRecord : public peru::CObject {
public:
    struct STrack {
        std::string artist, title, notes;
    };

    explicit CRecord(const CAudioCDInfo& info)
        : artist(toText(info.artist)), title(toText(info.title)), year(toText(info.year)),
          genre(toText(info.genre)), notes(toText(info.extended)) {
        for (const auto& track : info.tracks)
            tracks.push_back({toText(track->artist), toText(track->title), toText(track->extended)});
    }
    ~CRecord() override = default;

    const std::string artist, title, year, genre, notes;
    std::vector<STrack> tracks;
};

std::vector<int32_t> toOffsets(const int32_t* offsets, int32_t count) {
    if (!offsets || count <= 0) throw peru::CError("The disc has no tracks");
    return {offsets, offsets + count};
}

std::string getDefaultCacheFolder() {
    const P<peru::IURI> folder = peru::getSystem()->getCacheFolder()->appendPath("tonewright/cddb/");
    return CString::toStdString(peru::getPathes()->toPlatformPath(folder));
}

SFreeDBSettings readSettings(const TONEWRIGHT_CDDBSettings& record) {
    // An older host's record is shorter.
    TONEWRIGHT_CDDBSettings given = {};
    std::memcpy(static_cast<void*>(&given), &record, std::min(record.size, sizeof given));
    const auto take = [](std::string& target, const char* text) {
        if (text) target = text;
    };
    const auto takeTime = [](uint32_t& target, int32_t milliseconds) {
        if (milliseconds > 0) target = static_cast<uint32_t>(milliseconds);
    };
    if (!given.host || !*given.host) throw peru::CError("A look-up needs the host of a server");
    if (!given.clientName || !*given.clientName || !given.clientVersion || !*given.clientVersion)
        throw peru::CError("A look-up needs the name and the version of the application");
    SFreeDBSettings settings;
    take(settings.host, given.host);
    if (given.port != 0) settings.port = given.port;
    take(settings.path, given.path);
    take(settings.clientName, given.clientName);
    take(settings.clientVersion, given.clientVersion);
    take(settings.user, given.user);
    take(settings.userHost, given.userHost);
    if (given.proxy) settings.proxy = given.proxy;
    take(settings.noProxy, given.noProxy);
    takeTime(settings.connectTimeout, given.connectTimeout);
    takeTime(settings.silenceTimeout, given.silenceTimeout);
    takeTime(settings.totalTimeout, given.totalTimeout);
    take(settings.codePage, given.codePage);
    settings.cacheFolder = given.cacheFolder ? given.cacheFolder : getDefaultCacheFolder();
    settings.refreshCache = (given.flags & TONEWRIGHT_CDDB_REFRESH) != 0;
    return settings;
}

constexpr const char* kClient = "a client for look-ups of discs";
constexpr const char* kRecord = "the record of a disc";

size_t requireIndex(int32_t index, size_t count, const char* what) {
    if (index < 0 || static_cast<size_t>(index) >= count)
        throw peru::CError(CString::fromUTF8(std::string("There is no such ") + what));
    return static_cast<size_t>(index);
}

} // namespace

int32_t TONEWRIGHT_Host_GetCDDBDiscId(const int32_t* offsets, int32_t count, int32_t leadOut, uint32_t* id) {
    return guard(0, [&] {
        const uint32_t found = freedb::getLibrary()->getDiscId(toOffsets(offsets, count), leadOut);
        if (id) *id = found;
        return 1;
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateCDDB(const TONEWRIGHT_CDDBSettings* settings) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        if (!settings) throw peru::CError("A look-up needs settings");
        return wrap(peru::make<CLookUp>(readSettings(*settings)));
    });
}

int32_t TONEWRIGHT_Host_QueryCDDB(TONEWRIGHT_Handle cddb, const int32_t* offsets, int32_t count,
                                  int32_t leadOut) {
    return guard<int32_t>(TONEWRIGHT_CDDB_FAILED, [&] {
        const P<CLookUp> lookUp = require<CLookUp>(cddb, kClient);
        lookUp->set({});
        lookUp->set(lookUp->client->query(toOffsets(offsets, count), leadOut));
        return static_cast<int32_t>(lookUp->found.result);
    });
}

int32_t TONEWRIGHT_Host_GetCDDBCandidateCount(TONEWRIGHT_Handle cddb) {
    const P<CLookUp> lookUp = unwrap<CLookUp>(cddb);
    return lookUp ? static_cast<int32_t>(lookUp->texts.size()) : 0;
}

int32_t TONEWRIGHT_Host_GetCDDBCandidate(TONEWRIGHT_Handle cddb, int32_t index,
                                         TONEWRIGHT_CDDBCandidate* candidate) {
    return guard(0, [&] {
        const P<CLookUp> lookUp = require<CLookUp>(cddb, kClient);
        const size_t i = requireIndex(index, lookUp->texts.size(), "candidate");
        fillRecord(candidate, {sizeof(*candidate), lookUp->texts[i].category.c_str(),
                               lookUp->found.discs[i]->getDiscId(), lookUp->texts[i].title.c_str()});
        return 1;
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_ReadCDDB(TONEWRIGHT_Handle cddb, int32_t index) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<CLookUp> lookUp = require<CLookUp>(cddb, kClient);
        const size_t i = requireIndex(index, lookUp->found.discs.size(), "candidate");
        return wrap(peru::make<CRecord>(*lookUp->client->read(lookUp->found.discs[i])));
    });
}

int32_t TONEWRIGHT_Host_GetCDDBRecord(TONEWRIGHT_Handle record, TONEWRIGHT_CDDBRecord* disc) {
    return guard(0, [&] {
        const P<CRecord> found = require<CRecord>(record, kRecord);
        fillRecord(disc,
                   {sizeof(*disc), found->artist.c_str(), found->title.c_str(), found->year.c_str(),
                    found->genre.c_str(), found->notes.c_str(), static_cast<int32_t>(found->tracks.size())});
        return 1;
    });
}

int32_t TONEWRIGHT_Host_GetCDDBTrack(TONEWRIGHT_Handle record, int32_t index, TONEWRIGHT_CDDBTrack* track) {
    return guard(0, [&] {
        const P<CRecord> found = require<CRecord>(record, kRecord);
        const CRecord::STrack& entry = found->tracks[requireIndex(index, found->tracks.size(), "track")];
        fillRecord(track, {sizeof(*track), entry.artist.c_str(), entry.title.c_str(), entry.notes.c_str()});
        return 1;
    });
}

void TONEWRIGHT_Host_CancelCDDB(TONEWRIGHT_Handle cddb) {
    guard(0, [&] {
        require<CLookUp>(cddb, kClient)->client->cancel();
        return 1;
    });
}
