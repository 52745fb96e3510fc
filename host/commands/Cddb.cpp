#include "commands/Cddb.h"
#include "base/Cancel.h"
#include "base/CancelWatch.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "library/Failure.h"
#include "library/Library.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <nlohmann/json.hpp>
#include <poll.h>
#include <stdexcept>
#include <tonewright/host.h>
#include <unistd.h>
#include <vector>

namespace host {

namespace {

struct SCandidate {
    std::string category;
    uint32_t id;
    std::string title;
};

std::string toHex(uint32_t id) {
    char digits[9];
    std::snprintf(digits, sizeof digits, "%08x", id);
    return digits;
}

const char* toText(int32_t result) {
    return result == TONEWRIGHT_CDDB_EXACT ? "exact" : result == TONEWRIGHT_CDDB_INEXACT ? "inexact" : "none";
}

CHandle createClient(const SCddbOptions& options) {
    TONEWRIGHT_CDDBSettings settings = {};
    settings.size = sizeof settings;
    settings.host = options.server.host.c_str();
    settings.port = options.server.port;
    if (!options.server.path.empty()) settings.path = options.server.path.c_str();
    settings.clientName = "tonewright";
    settings.clientVersion = TONEWRIGHT_VERSION;
    if (!options.user.empty()) settings.user = options.user.c_str();
    if (!options.userHost.empty()) settings.userHost = options.userHost.c_str();
    if (options.proxy) settings.proxy = options.proxy->c_str();
    if (!options.codePage.empty()) settings.codePage = options.codePage.c_str();
    settings.totalTimeout = static_cast<int32_t>(options.timeout * 1000);
    if (!options.useCache) settings.cacheFolder = "";
    settings.flags = options.refresh ? TONEWRIGHT_CDDB_REFRESH : 0;
    CHandle client(TONEWRIGHT_Host_CreateCDDB(&settings));
    if (!client) throw std::runtime_error(takeFailure("The server cannot be used"));
    return client;
}

std::vector<SCandidate> readCandidates(const CHandle& client) {
    std::vector<SCandidate> candidates;
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetCDDBCandidateCount(client.get()); ++i) {
        TONEWRIGHT_CDDBCandidate each = {};
        each.size = sizeof each;
        if (TONEWRIGHT_Host_GetCDDBCandidate(client.get(), i, &each) == 1)
            candidates.push_back({each.category, each.id, each.title});
    }
    return candidates;
}

nlohmann::json toJson(const std::vector<SCandidate>& candidates) {
    nlohmann::json all = nlohmann::json::array();
    for (const SCandidate& each : candidates)
        all.push_back({{"category", each.category}, {"id", toHex(each.id)}, {"title", each.title}});
    return all;
}

void print(const std::vector<SCandidate>& candidates, std::FILE* to) {
    for (size_t i = 0; i < candidates.size(); ++i)
        std::fprintf(to, "%3zu  %-10s  %s  %s\n", i + 1, toPrintable(candidates[i].category).c_str(),
                     toHex(candidates[i].id).c_str(), toPrintable(candidates[i].title).c_str());
}

// A line from the terminal, empty at its end and after Ctrl-C.
std::string readAnswer() {
    std::string line;
    while (!isCancelled()) {
        pollfd input{STDIN_FILENO, POLLIN, 0};
        if (::poll(&input, 1, 50) <= 0) continue;
        char c = '\0';
        if (::read(STDIN_FILENO, &c, 1) != 1 || c == '\n') return line;
        line += c;
    }
    return {};
}

// The index of the chosen candidate; empty if the user chose none.
std::optional<size_t> ask(const std::vector<SCandidate>& candidates, bool isExact) {
    std::fprintf(stderr, "%s\n",
                 isExact ? "Several records fit the disc:" : "These records are similar to the disc:");
    print(candidates, stderr);
    for (;;) {
        std::fprintf(stderr, "Number (empty for none): ");
        const std::string answer = readAnswer();
        if (answer.empty()) return std::nullopt;
        size_t number = 0;
        const auto [end, error] = std::from_chars(answer.data(), answer.data() + answer.size(), number);
        if (error == std::errc() && end == answer.data() + answer.size() && number >= 1 &&
            number <= candidates.size())
            return number - 1;
    }
}

bool canAsk() {
    return ::isatty(STDIN_FILENO) && ::isatty(STDERR_FILENO);
}

nlohmann::json toJson(const TONEWRIGHT_CDDBRecord& disc, const std::vector<TONEWRIGHT_CDDBTrack>& tracks) {
    nlohmann::json list = nlohmann::json::array();
    for (size_t i = 0; i < tracks.size(); ++i)
        list.push_back({{"number", i + 1},
                        {"artist", tracks[i].artist},
                        {"title", tracks[i].title},
                        {"notes", tracks[i].notes}});
    return {{"artist", disc.artist}, {"title", disc.title}, {"year", disc.year},
            {"genre", disc.genre},   {"notes", disc.notes}, {"tracks", list}};
}

void printLines(const std::string& indent, const std::string& text) {
    for (size_t at = 0; at < text.size();) {
        const size_t end = std::min(text.find('\n', at), text.size());
        std::printf("%s%s\n", indent.c_str(), toPrintable(text.substr(at, end - at)).c_str());
        at = end + 1;
    }
}

void print(const TONEWRIGHT_CDDBRecord& disc, const std::vector<TONEWRIGHT_CDDBTrack>& tracks) {
    const struct {
        const char* name;
        const char* text;
    } lines[] = {{"Artist", disc.artist}, {"Album", disc.title}, {"Year", disc.year}, {"Genre", disc.genre}};
    for (const auto& line : lines)
        if (*line.text) std::printf("%-7s %s\n", line.name, toPrintable(line.text).c_str());
    printLines("", disc.notes);
    for (size_t i = 0; i < tracks.size(); ++i) {
        const std::string artist = *tracks[i].artist ? std::string(tracks[i].artist) + " - " : "";
        std::printf("%3zu  %s\n", i + 1, toPrintable(artist + tracks[i].title).c_str());
        printLines("     ", tracks[i].notes);
    }
}

void showRecord(const CHandle& record, const SCandidate& candidate, nlohmann::json line, bool json) {
    TONEWRIGHT_CDDBRecord disc = {};
    disc.size = sizeof disc;
    TONEWRIGHT_Host_GetCDDBRecord(record.get(), &disc);
    std::vector<TONEWRIGHT_CDDBTrack> tracks(static_cast<size_t>(disc.trackCount));
    for (size_t i = 0; i < tracks.size(); ++i) {
        tracks[i].size = sizeof tracks[i];
        TONEWRIGHT_Host_GetCDDBTrack(record.get(), static_cast<int32_t>(i), &tracks[i]);
    }
    if (!json) return print(disc, tracks);
    line["category"] = candidate.category;
    line["record_id"] = toHex(candidate.id);
    line.update(toJson(disc, tracks));
    std::printf("%s\n", toLine(line).c_str());
}

int lookUp(const SCddbOptions& options) {
    const SDiscToc toc = options.toc ? *options.toc : readCueToc(options.input);
    const uint32_t id = getDiscId(toc);
    nlohmann::json line = {{"id", toHex(id)}, {"toc", toc.offsets}, {"lead_out", toc.leadOut}};
    clearFailure();
    const CHandle client = createClient(options);
    const CCancelWatch watch([&] { TONEWRIGHT_Host_CancelCDDB(client.get()); });
    const int32_t result = TONEWRIGHT_Host_QueryCDDB(client.get(), toc.offsets.data(),
                                                     static_cast<int32_t>(toc.offsets.size()), toc.leadOut);
    if (isCancelled()) return kExitCancelled;
    if (result == TONEWRIGHT_CDDB_FAILED) throw std::runtime_error(takeFailure("The look-up failed"));
    const std::vector<SCandidate> candidates = readCandidates(client);
    line["match"] = toText(result);
    if (candidates.empty()) {
        if (!options.json) throw std::runtime_error("No record fits the disc " + toHex(id));
        std::printf("%s\n", toLine(line).c_str());
        return kExitFailure;
    }

    size_t chosen = 0;
    const bool isClear = result == TONEWRIGHT_CDDB_EXACT && candidates.size() == 1;
    if (options.pick > 0 && !options.list) {
        if (static_cast<size_t>(options.pick) > candidates.size())
            throw std::runtime_error("There are only " + std::to_string(candidates.size()) + " records");
        chosen = static_cast<size_t>(options.pick) - 1;
    } else if (options.list || (!isClear && !canAsk())) {
        line["candidates"] = toJson(candidates);
        if (options.json)
            std::printf("%s\n", toLine(line).c_str());
        else
            print(candidates, stdout);
        if (options.list) return kExitSuccess;
        if (!options.json)
            std::fprintf(stderr, "tonewright: %s; --pick chooses one by its number\n",
                         result == TONEWRIGHT_CDDB_EXACT ? "Several records fit the disc"
                                                         : "No record fits the disc exactly");
        return kExitFailure;
    } else if (!isClear) {
        const std::optional<size_t> answer = ask(candidates, result == TONEWRIGHT_CDDB_EXACT);
        if (!answer) return isCancelled() ? kExitCancelled : kExitFailure;
        chosen = *answer;
    }
    const CHandle record(TONEWRIGHT_Host_ReadCDDB(client.get(), static_cast<int32_t>(chosen)));
    if (isCancelled()) return kExitCancelled;
    if (!record) throw std::runtime_error(takeFailure("The record cannot be read"));
    showRecord(record, candidates[chosen], std::move(line), options.json);
    return kExitSuccess;
}

} // namespace

int lookUpDisc(const SCddbOptions& options) {
    try {
        const int code = lookUp(options);
        flushOutput();
        return code;
    } catch (const std::exception& error) {
        const std::string about = options.toc ? "" : toPrintable(options.input.native()) + ": ";
        std::string reason = error.what();
        if (reason.ends_with('.')) reason.pop_back();
        if (options.json) {
            std::printf("%s\n", toLine({{"error", reason}}).c_str());
            flushOutput();
        } else {
            std::fprintf(stderr, "tonewright: %s%s\n", about.c_str(), toPrintable(reason).c_str());
        }
        return kExitFailure;
    }
}

} // namespace host
