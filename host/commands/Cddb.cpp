#include "commands/Cddb.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/CddbChoice.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cstdio>
#include <nlohmann/json.hpp>
#include <stdexcept>

namespace host {

namespace {

nlohmann::json toJson(const std::vector<SCddbCandidate>& candidates) {
    nlohmann::json all = nlohmann::json::array();
    for (const SCddbCandidate& each : candidates)
        all.push_back({{"category", each.category}, {"id", formatDiscId(each.id)}, {"title", each.title}});
    return all;
}

nlohmann::json toJson(const SCddbRecord& record) {
    nlohmann::json list = nlohmann::json::array();
    for (const SCddbRecord::STrack& track : record.tracks)
        list.push_back({{"number", list.size() + 1},
                        {"artist", track.artist},
                        {"title", track.title},
                        {"notes", track.notes}});
    return {{"artist", record.artist}, {"title", record.title}, {"year", record.year},
            {"genre", record.genre},   {"notes", record.notes}, {"tracks", list}};
}

void printLines(const std::string& indent, const std::string& text) {
    for (size_t at = 0; at < text.size();) {
        const size_t end = std::min(text.find('\n', at), text.size());
        std::printf("%s%s\n", indent.c_str(), toPrintable(text.substr(at, end - at)).c_str());
        at = end + 1;
    }
}

void print(const SCddbRecord& record) {
    const std::pair<std::string, std::string> lines[] = {{tr("host.Cddb.Artist", "Artist"), record.artist},
                                                         {tr("host.Cddb.Album", "Album"), record.title},
                                                         {tr("host.Cddb.Year", "Year"), record.year},
                                                         {tr("host.Cddb.Genre", "Genre"), record.genre}};
    size_t columns = 7;
    for (const auto& [name, text] : lines) columns = std::max(columns, countColumns(name));
    for (const auto& [name, text] : lines)
        if (!text.empty())
            std::printf("%s %s\n", fitColumns(name, columns).c_str(), toPrintable(text).c_str());
    printLines("", record.notes);
    size_t number = 0;
    for (const SCddbRecord::STrack& track : record.tracks) {
        const std::string artist = track.artist.empty() ? "" : track.artist + " - ";
        std::printf("%3zu  %s\n", ++number, toPrintable(artist + track.title).c_str());
        printLines("     ", track.notes);
    }
}

void printJson(const nlohmann::json& line) {
    std::printf("%s\n", toLine(line).c_str());
}

int lookUp(const SCddbOptions& options) {
    const SDiscToc toc = options.toc ? *options.toc : findToc(options.input);
    nlohmann::json line = {
        {"id", formatDiscId(getDiscId(toc))}, {"toc", toc.offsets}, {"lead_out", toc.leadOut}};
    const CCddbLookup lookup(options, toc);
    if (isCancelled()) return kExitCancelled;
    const std::vector<SCddbCandidate>& candidates = lookup.getCandidates();
    line["match"] = candidates.empty() ? "none" : lookup.isExact() ? "exact" : "inexact";
    if (candidates.empty()) {
        if (!options.json) throw std::runtime_error(describeNoMatch(toc));
        printJson(line);
        return kExitFailure;
    }

    const SCddbChoice choice =
        options.list ? SCddbChoice{EChoice::open, 0} : chooseRecord(lookup, options.pick);
    if (isCancelled()) return kExitCancelled;
    if (choice.kind == EChoice::refused) return kExitFailure;
    if (choice.kind == EChoice::open) {
        line["candidates"] = toJson(candidates);
        if (options.json)
            printJson(line);
        else
            printCandidates(lookup, stdout);
        if (options.list) return kExitSuccess;
        if (!options.json) reportOpenChoice(lookup);
        return kExitFailure;
    }
    const std::optional<SCddbRecord> record = lookup.read(choice.candidate);
    if (!record) return kExitCancelled;
    if (options.json) {
        line["category"] = candidates[choice.candidate].category;
        line["record_id"] = formatDiscId(candidates[choice.candidate].id);
        line.update(toJson(*record));
        printJson(line);
    } else {
        print(*record);
    }
    return kExitSuccess;
}

} // namespace

int lookUpDisc(const SCddbOptions& options) {
    try {
        const int code = lookUp(options);
        flushOutput();
        return code;
    } catch (const std::exception& error) {
        const bool hasName = !options.toc && !options.input.empty();
        std::string reason = hasName ? asReason(error.what(), options.input) : error.what();
        if (reason.ends_with('.')) reason.pop_back();
        if (options.json) {
            printJson({{"error", reason}});
            flushOutput();
        } else {
            const std::string about = hasName ? toPrintable(options.input.native()) + ": " : "";
            std::fprintf(stderr, "tonewright: %s%s\n", about.c_str(), toPrintable(reason).c_str());
        }
        return kExitFailure;
    }
}

} // namespace host
