// What there is to play: files, http addresses, folders, playlists and cue sheets as a list of items.
#pragma once

#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace host {

struct SPlayItem {
    std::filesystem::path file;
    std::filesystem::path name; // as shown: the file, or the cue sheet
    int track = 0;              // of a cue sheet; 0: the whole file
    int64_t begin = 0;          // in frames of a cue sheet, kCueFrames per second
    std::optional<int64_t> end; // empty: to the end of the file
    std::string title;          // from the playlist; may be empty
    bool isStream = false;      // an address that is read while it plays
    std::string failure;        // why there is nothing to play, if that is known already
};

constexpr int kCueFrames = 75;

// The items in the order of the inputs. Playlists may contain folders and other playlists; their relative
// entries start at the folder of the playlist. Of a folder, files with one of the extensions (lower case,
// without a dot) are taken in natural order, with `isRecursive` also those in folders below it. Whatever
// cannot be read becomes an item with a failure.
std::vector<SPlayItem> listItems(const std::vector<std::filesystem::path>& inputs,
                                 const std::set<std::string>& extensions, bool isRecursive);

} // namespace host
