// What is in a faked drive, and how the drive answers to commands about it.
#pragma once

#include <map>
#include <set>
#include <string>
#include <vector>

namespace tests {

// Guarded by the tests' order: it changes only between calls of the library.
struct SFakeDisc {
    bool isPresent = true;
    bool isBlank = false;
    bool hasChanged = false;     // since the drive was last asked
    int profile = 0;             // of the medium; 0 for a CD
    int notReady = 0;            // how often the drive reports that it is not ready
    int trayError = 0;           // of moving the tray
    std::string trayMoves;       // "o" and "c"
    std::vector<int> starts;     // blocks of the tracks, then of the lead-out
    std::vector<int> pregaps;    // of the tracks, in blocks; 0 for those that are not listed
    std::set<size_t> dataTracks; // indices
    int sessionStart = 0;        // block of the last session, if there are several
    std::string samples;         // from block 0
    std::string textPacks;
    std::string code; // ISRC of every track

    int badBlock = -1;           // cannot be read
    std::map<int, int> failures; // by block: how often it cannot be read
    int jitter = 0;              // one read in three is off by up to that many frames
    int readMicroseconds = 0;    // the time that a read takes
    int readsUntilOpened = -1;   // the tray is opened after them
    int subchannelReads = 0;     // so far
};
SFakeDisc& fakeDisc();

// CD-TEXT packs with titles; the first one is that of the disc.
std::string makeTextPacks(const std::vector<std::string>& titles);

std::string toBig(unsigned value, int bytes);
// The answer to a SCSI command; false if the drive refuses it.
bool answer(const unsigned char* command, std::string& reply);

} // namespace tests
