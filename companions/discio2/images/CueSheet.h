// Cue sheets as text. Own code, since the type of a FILE, the difference between PREGAP and INDEX 00 and an
// INDEX 00 in the FILE before are all needed to find the sectors.
#pragma once

#include "Medium.h"

#include <string_view>

namespace discio {

struct SCueFile {
    std::string name;
    std::string type; // BINARY, MOTOROLA, WAVE, ..., in capitals
};

struct SCueIndex {
    int number = 0;
    int file = 0;     // of the sheet
    int32_t time = 0; // in the file, in blocks
};

struct SCueTrack {
    int number = 0;
    std::string mode;   // AUDIO, MODE1/2352, ..., in capitals
    int32_t pregap = 0; // silence that is in no file
    int32_t postgap = 0;
    std::vector<SCueIndex> indices; // in order
    Texts texts = {};
};

struct SCueSheet {
    std::vector<SCueFile> files;
    std::vector<SCueTrack> tracks;
    Texts texts = {};
    std::string textFile; // CDTEXTFILE
};

// Unknown commands are ignored. Throws CDiscError with the line.
SCueSheet parseCueSheet(std::string_view bytes, const std::string& path);

} // namespace discio
