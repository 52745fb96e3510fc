// Records of a CDDB server.
#pragma once

#include "library/Library.h"
#include "media/DiscToc.h"

#include <optional>
#include <string>
#include <vector>

namespace host {

struct SCddbServer {
    std::string host;
    int port = 80;
    std::string path; // empty for the usual one
};

struct SCddbAccess {
    SCddbServer server;
    std::string user;     // empty for an anonymous one
    std::string userHost; // of the user
    std::optional<std::string> proxy;
    std::string codePage;
    double timeout = 0; // seconds for each request; 0: none
    bool useCache = true;
    bool refresh = false;
};

struct SCddbCandidate {
    std::string category;
    uint32_t id;
    std::string title;
};

struct SCddbRecord {
    struct STrack {
        std::string artist; // empty for that of the disc
        std::string title;
        std::string notes;
    };
    std::string artist, title, year, genre, notes;
    std::vector<STrack> tracks;
};

// "0200b401"
std::string formatDiscId(uint32_t id);

// The records that fit a disc.
class CCddbLookup {
public:
    // Asks the server, or the cache. Without candidates after Ctrl-C. Throws std::runtime_error.
    CCddbLookup(const SCddbAccess& access, const SDiscToc& toc);

    bool isExact() const;
    const std::vector<SCddbCandidate>& getCandidates() const { return m_candidates; }
    // Whether there is one record, and it fits exactly.
    bool isClear() const { return isExact() && m_candidates.size() == 1; }
    // Empty after Ctrl-C. Throws std::runtime_error.
    std::optional<SCddbRecord> read(size_t candidate) const;

private:
    CHandle m_client;
    int32_t m_result = 0;
    std::vector<SCddbCandidate> m_candidates;
};

} // namespace host
