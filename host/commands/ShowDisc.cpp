#include "commands/ShowDisc.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Disc.h"
#include "terminal/Progress.h"

#include <cstdio>

namespace host {

namespace {

// Prints the files of a folder and below.
void showFiles(DISCIO_DataCursor* cursor, bool json) {
    const SDiscFunctions& functions = getDiscFunctions();
    while (functions.DataCursorNext(cursor) == 1) {
        std::string path = toUTF8(functions.DataCursorGetDiscPathW(cursor));
        replaceAll(path, "\\", "/");
        const bool isFolder = functions.DataCursorIsFolder(cursor) == 1;
        const int64_t size = functions.DataCursorGetSize(cursor);
        if (json)
            std::printf("%s\n", toLine({{"file", path}, {"folder", isFolder}, {"bytes", size}}).c_str());
        else
            std::printf("%10s  %s%s\n", isFolder ? "" : formatSize(static_cast<uint64_t>(size)).c_str(),
                        toPrintable(path).c_str(), isFolder ? "/" : "");
        if (!isFolder) continue;
        const DiscHandle<DISCIO_DataCursor> inner(functions.DataCursorCreateSubCursor(cursor));
        if (!inner) throw makeDiscError();
        showFiles(inner.get(), json);
    }
}

void showTrack(const SDiscTrack& track, int position, bool json) {
    if (json) {
        std::printf("%s\n", toLine({{"track", position},
                                    {"audio", track.number > 0},
                                    {"start", track.start},
                                    {"blocks", track.length},
                                    {"pregap", track.pregap},
                                    {"duration", track.getSeconds()},
                                    {"title", track.title},
                                    {"performer", track.performer},
                                    {"isrc", track.code}})
                                .c_str());
        return;
    }
    std::string text = track.number > 0 ? track.title : tr("host.Disc.data", "(data)");
    if (!track.performer.empty()) text += " / " + track.performer;
    if (!track.code.empty()) text += "  " + track.code;
    std::printf("%5d %11s %8d %8d %7d  %s\n", position, formatDuration(track.getSeconds()).c_str(),
                track.start, track.length, track.pregap, toPrintable(text).c_str());
}

} // namespace

int showDisc(const std::filesystem::path& place, bool json) {
    const SDiscFunctions& functions = getDiscFunctions();
    const CDisc disc(place);
    DISCIO_Disc* handle = disc.getHandle();
    const std::string medium = describeMedium(functions.DiscGetMediumType(handle));
    const bool isEmpty = functions.DiscIsEmpty(handle) == 1;
    const bool hasData = functions.DiscHasDataComponent(handle) == 1;
    const int64_t capacity = functions.DiscGetCapacityBytes(handle);
    const char16_t* label = hasData ? functions.DiscDataGetTitleW(handle) : nullptr;
    std::string title = disc.getText(DISCIO_TEXT_TITLE);
    if (title.empty() && label) title = toUTF8(label);
    const std::string performer = disc.getText(DISCIO_TEXT_PERFORMER);
    const std::string catalogue = disc.getText(DISCIO_TEXT_CODE);
    if (json) {
        std::printf("%s\n", toLine({{"disc", disc.getPlace()},
                                    {"medium", medium},
                                    {"blank", isEmpty},
                                    {"capacity", capacity},
                                    {"title", title},
                                    {"performer", performer},
                                    {"catalogue", catalogue}})
                                .c_str());
    } else {
        std::printf("%s: %s%s%s\n", toPrintable(disc.getPlace()).c_str(),
                    isEmpty ? (tr("host.Disc.blank", "blank") + " ").c_str() : "", medium.c_str(),
                    capacity > 0 ? (", " + formatSize(static_cast<uint64_t>(capacity))).c_str() : "");
        for (const auto& [name, text] : {std::pair(tr("host.Disc.title", "Title"), title),
                                         {tr("host.Disc.performer", "Performer"), performer},
                                         {tr("host.Disc.catalogue", "Catalogue"), catalogue}})
            if (!text.empty()) std::printf("%s: %s\n", name.c_str(), toPrintable(text).c_str());
        if (!disc.getTracks().empty())
            std::printf("%5s %11s %8s %8s %7s  %s\n", tr("host.Disc.track", "track").c_str(),
                        tr("host.Disc.duration", "duration").c_str(), tr("host.Disc.start", "start").c_str(),
                        tr("host.Disc.blocks", "blocks").c_str(), tr("host.Disc.pregap", "pregap").c_str(),
                        tr("host.Disc.trackTitle", "title").c_str());
    }
    int position = 0;
    for (const SDiscTrack& track : disc.getTracks()) showTrack(track, ++position, json);
    if (const int32_t hidden = disc.getHiddenBlocks(); hidden > 0 && !json) {
        char seconds[32];
        std::snprintf(seconds, sizeof seconds, "%.1f", static_cast<double>(hidden) / kBlocksPerSecond);
        std::printf("%s\n", tr("host.Disc.hidden", "There are %SECONDS% seconds of sound before track 1",
                               {{"%SECONDS%", seconds}})
                                .c_str());
    }
    if (hasData) {
        const DiscHandle<DISCIO_DataCursor> root(functions.DiscDataCreateCursorW(handle, u""));
        if (!root) throw makeDiscError();
        showFiles(root.get(), json);
    }
    flushOutput();
    return kExitSuccess;
}

} // namespace host
