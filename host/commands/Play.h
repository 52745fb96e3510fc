// tonewright play
#pragma once

#include "library/Library.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

constexpr int kMostVolume = 130; // percent

struct SPlayOptions {
    std::vector<std::filesystem::path> inputs; // files, folders and playlists
    std::string device;                        // id or name; empty for the default device
    int volume = 100;                          // percent of the samples
    double start = 0;                          // seconds, in the first item
    bool isRecursive = false;
    bool isShuffled = false;
    bool loops = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int play(CLibrary& library, const SPlayOptions& options);

} // namespace host
