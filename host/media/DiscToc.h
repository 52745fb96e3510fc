// The tables of contents of audio CDs.
#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

namespace host {

class CDisc;

// Positions in frames of 1/75 second, which include the pre-gap of 150 frames before the first track.
struct SDiscToc {
    std::vector<int32_t> offsets; // of the tracks
    int32_t leadOut = 0;
};

// "150 17827 ... 207105": the offsets of the tracks and that of the lead-out, separated by blanks or commas.
// Throws std::invalid_argument.
SDiscToc parseDiscToc(const std::string& text);

// The disc that a cue sheet describes, with the lengths of its sound files. Throws std::runtime_error.
SDiscToc readCueToc(const std::filesystem::path& sheet);

// That of a disc or disc image, with its data tracks. Throws std::runtime_error.
SDiscToc readToc(const CDisc& disc);

// That of a drive or disc image, or of a cue sheet of sound files; without a name, that of the first drive
// with a disc. Throws std::runtime_error.
SDiscToc findToc(const std::filesystem::path& place);

// The id of the disc for CDDB. Throws std::runtime_error if the positions do not ascend.
uint32_t getDiscId(const SDiscToc& toc);

} // namespace host
