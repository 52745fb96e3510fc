// The server and the client of a CDDB look-up.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace freedb {

// Text is UTF-8. Times are in milliseconds, 0 means no limit.
struct SFreeDBSettings {
    std::string host; // no server is built in
    int32_t port = 80;
    std::string path = "/~cddb/cddb.cgi";

    // What the server is told about the client. User and host are not those of the machine unless the
    // application wants that.
    std::string user = "anon";
    std::string userHost = "anon";
    std::string clientName;
    std::string clientVersion;

    // "host", "host:port" or a URI; port 80 if none is given. Empty text means a direct connection, and no
    // value means the proxy of the system.
    std::optional<std::string> proxy;
    std::string noProxy; // hosts that `proxy` does not serve, see peru::net::isBypassed

    uint32_t connectTimeout = 10'000;
    uint32_t silenceTimeout = 30'000;
    uint32_t totalTimeout = 0;
    int64_t maxReplySize = 16 << 20; // bytes

    // The encoding of replies that are not UTF-8, by its name for iconv. Empty: the one that the server
    // states, otherwise Windows-1252.
    std::string codePage;

    std::string cacheFolder;   // path; empty for no cache
    bool refreshCache = false; // asks the server even if the answer is in the cache
};

} // namespace freedb
