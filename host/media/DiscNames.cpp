#include "media/DiscNames.h"

#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "media/CddbChoice.h"

#include <stdexcept>

namespace host {

namespace {

SDiscTexts toTexts(SCddbRecord record) {
    SDiscTexts texts{std::move(record.title),
                     std::move(record.artist),
                     std::move(record.year),
                     std::move(record.genre),
                     {}};
    for (SCddbRecord::STrack& track : record.tracks)
        texts.tracks.emplace_back(std::move(track.title), std::move(track.artist));
    return texts;
}

} // namespace

int nameDisc(CDisc& disc, const SCddbAccess& access, int pick) {
    const SDiscToc toc = readToc(disc);
    const CCddbLookup lookup(access, toc);
    if (isCancelled()) return kExitCancelled;
    if (lookup.getCandidates().empty()) throw std::runtime_error(describeNoMatch(toc));
    const SCddbChoice choice = chooseRecord(lookup, pick);
    if (isCancelled()) return kExitCancelled;
    if (choice.kind == EChoice::open) {
        printCandidates(lookup, stderr);
        reportOpenChoice(lookup);
    }
    if (choice.kind != EChoice::made) return kExitFailure;
    std::optional<SCddbRecord> record = lookup.read(choice.candidate);
    if (!record) return kExitCancelled;
    disc.setTexts(toTexts(std::move(*record)));
    return kExitSuccess;
}

} // namespace host
