#include "media/CddbLookup.h"

#include "base/CancelWatch.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <cstdio>
#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace {

CHandle createClient(const SCddbAccess& access) {
    TONEWRIGHT_CDDBSettings settings = {};
    settings.size = sizeof settings;
    settings.host = access.server.host.c_str();
    settings.port = access.server.port;
    if (!access.server.path.empty()) settings.path = access.server.path.c_str();
    settings.clientName = "tonewright";
    settings.clientVersion = TONEWRIGHT_VERSION;
    if (!access.user.empty()) settings.user = access.user.c_str();
    if (!access.userHost.empty()) settings.userHost = access.userHost.c_str();
    if (access.proxy) settings.proxy = access.proxy->c_str();
    if (!access.codePage.empty()) settings.codePage = access.codePage.c_str();
    settings.totalTimeout = static_cast<int32_t>(access.timeout * 1000);
    if (!access.useCache) settings.cacheFolder = "";
    settings.flags = access.refresh ? TONEWRIGHT_CDDB_REFRESH : 0;
    CHandle client(TONEWRIGHT_Host_CreateCDDB(&settings));
    if (!client)
        throw std::runtime_error(takeFailure(tr("host.Cddb.badServer", "The server cannot be used")));
    return client;
}

} // namespace

std::string formatDiscId(uint32_t id) {
    char digits[9];
    std::snprintf(digits, sizeof digits, "%08x", id);
    return digits;
}

CCddbLookup::CCddbLookup(const SCddbAccess& access, const SDiscToc& toc) {
    clearFailure();
    m_client = createClient(access);
    const CCancelWatch watch([this] { TONEWRIGHT_Host_CancelCDDB(m_client.get()); });
    m_result = TONEWRIGHT_Host_QueryCDDB(m_client.get(), toc.offsets.data(),
                                         static_cast<int32_t>(toc.offsets.size()), toc.leadOut);
    if (isCancelled()) return;
    if (m_result == TONEWRIGHT_CDDB_FAILED)
        throw std::runtime_error(takeFailure(tr("host.Cddb.failed", "The look-up failed")));
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetCDDBCandidateCount(m_client.get()); ++i) {
        TONEWRIGHT_CDDBCandidate each = {};
        each.size = sizeof each;
        if (TONEWRIGHT_Host_GetCDDBCandidate(m_client.get(), i, &each) == 1)
            m_candidates.push_back({each.category, each.id, each.title});
    }
}

bool CCddbLookup::isExact() const {
    return m_result == TONEWRIGHT_CDDB_EXACT;
}

std::optional<SCddbRecord> CCddbLookup::read(size_t candidate) const {
    clearFailure();
    const CCancelWatch watch([this] { TONEWRIGHT_Host_CancelCDDB(m_client.get()); });
    const CHandle handle(TONEWRIGHT_Host_ReadCDDB(m_client.get(), static_cast<int32_t>(candidate)));
    if (isCancelled()) return std::nullopt;
    TONEWRIGHT_CDDBRecord disc = {};
    disc.size = sizeof disc;
    if (!handle || TONEWRIGHT_Host_GetCDDBRecord(handle.get(), &disc) != 1)
        throw std::runtime_error(takeFailure(tr("host.Cddb.unreadable", "The record cannot be read")));
    SCddbRecord record{disc.artist, disc.title, disc.year, disc.genre, disc.notes, {}};
    for (int32_t i = 0; i < disc.trackCount; ++i) {
        TONEWRIGHT_CDDBTrack track = {};
        track.size = sizeof track;
        if (TONEWRIGHT_Host_GetCDDBTrack(handle.get(), i, &track) == 1)
            record.tracks.push_back({track.artist, track.title, track.notes});
    }
    return record;
}

} // namespace host
