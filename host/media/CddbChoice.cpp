#include "media/CddbChoice.h"

#include "base/Cancel.h"
#include "base/Text.h"
#include "base/Translation.h"

#include <charconv>
#include <poll.h>
#include <stdexcept>
#include <unistd.h>

namespace host {

namespace {

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
std::optional<size_t> ask(const CCddbLookup& lookup) {
    std::fprintf(stderr, "%s\n",
                 (lookup.isExact() ? tr("host.Cddb.severalFit", "Several records fit the disc:")
                                   : tr("host.Cddb.similar", "These records are similar to the disc:"))
                     .c_str());
    printCandidates(lookup, stderr);
    for (;;) {
        std::fprintf(stderr, "%s ", tr("host.Cddb.number", "Number (empty for none):").c_str());
        const std::string answer = readAnswer();
        if (answer.empty()) return std::nullopt;
        size_t number = 0;
        const auto [end, error] = std::from_chars(answer.data(), answer.data() + answer.size(), number);
        if (error == std::errc() && end == answer.data() + answer.size() && number >= 1 &&
            number <= lookup.getCandidates().size())
            return number - 1;
    }
}

bool canAsk() {
    return ::isatty(STDIN_FILENO) && ::isatty(STDERR_FILENO);
}

} // namespace

SCddbChoice chooseRecord(const CCddbLookup& lookup, int pick) {
    const size_t count = lookup.getCandidates().size();
    if (pick > 0) {
        if (static_cast<size_t>(pick) > count)
            throw std::runtime_error(count == 1 ? tr("host.Cddb.onlyOne", "There is only one record")
                                                : tr("host.Cddb.only", "There are only %NUMBER% records",
                                                     {{"%NUMBER%", std::to_string(count)}}));
        return {EChoice::made, static_cast<size_t>(pick) - 1};
    }
    if (lookup.isClear()) return {EChoice::made, 0};
    if (!canAsk()) return {EChoice::open, 0};
    const std::optional<size_t> answer = ask(lookup);
    return {answer ? EChoice::made : EChoice::refused, answer.value_or(0)};
}

void printCandidates(const CCddbLookup& lookup, std::FILE* to) {
    size_t number = 0;
    for (const SCddbCandidate& each : lookup.getCandidates())
        std::fprintf(to, "%3zu  %-10s  %s  %s\n", ++number, toPrintable(each.category).c_str(),
                     formatDiscId(each.id).c_str(), toPrintable(each.title).c_str());
}

void reportOpenChoice(const CCddbLookup& lookup) {
    const std::string reason =
        lookup.isExact()
            ? tr("host.Cddb.pickExact", "Several records fit the disc; --pick chooses one by its number")
            : tr("host.Cddb.pickSimilar",
                 "No record fits the disc exactly; --pick chooses one by its number");
    std::fprintf(stderr, "tonewright: %s\n", reason.c_str());
}

std::string describeNoMatch(const SDiscToc& toc) {
    return tr("host.Cddb.none", "No record fits the disc %ID%", {{"%ID%", formatDiscId(getDiscId(toc))}});
}

} // namespace host
