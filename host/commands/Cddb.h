// tonewright cddb
#pragma once

#include "media/DiscToc.h"

#include <filesystem>
#include <optional>
#include <string>

namespace host {

struct SCddbServer {
    std::string host;
    int port = 80;
    std::string path; // empty for the usual one
};

struct SCddbOptions {
    std::optional<SDiscToc> toc; // otherwise that of the input
    std::filesystem::path input; // a cue sheet
    SCddbServer server;
    std::string user;     // empty for an anonymous one
    std::string userHost; // of the user
    std::optional<std::string> proxy;
    std::string codePage;
    double timeout = 0; // seconds for each request; 0: none
    int pick = 0;       // from 1 on; 0 asks
    bool list = false;
    bool json = false;
    bool useCache = true;
    bool refresh = false;
};

// Returns an exit code.
int lookUpDisc(const SCddbOptions& options);

} // namespace host
