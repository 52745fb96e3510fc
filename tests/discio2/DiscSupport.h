// Disc images for the tests, and handles that release themselves.
#pragma once

#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <random>
#include <string>
#include <tonewright/discio2.h>

namespace tests {

struct SReleaseHandle {
    template <class T> void operator()(T* handle) const { DISCIO_Release(handle); }
};
template <class T> using Discio = std::unique_ptr<T, SReleaseHandle>;

constexpr size_t kSectorBytes = 2352;

inline std::u16string wide(const std::string& ascii) {
    return {ascii.begin(), ascii.end()};
}

inline std::string narrow(const char16_t* text) {
    const std::u16string_view view = text ? text : u"(null)";
    return {view.begin(), view.end()};
}

// Samples that differ everywhere, so that every shift is seen.
inline std::string makeSectors(size_t count, unsigned seed) {
    std::mt19937 random(seed);
    std::string bytes(count * kSectorBytes, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    return bytes;
}

inline std::string swapPairs(std::string bytes) {
    for (size_t i = 0; i + 1 < bytes.size(); i += 2) std::swap(bytes[i], bytes[i + 1]);
    return bytes;
}

inline std::string little(uint64_t value, int bytes) {
    std::string text;
    for (int i = 0; i < bytes; ++i) text += static_cast<char>(value >> 8 * i);
    return text;
}
inline std::string big(uint64_t value, int bytes) {
    const std::string text = little(value, bytes);
    return {text.rbegin(), text.rend()};
}

inline std::string toWave(const std::string& pcm) {
    return "RIFF" + little(36 + pcm.size(), 4) + "WAVEfmt " + little(16, 4) + little(1, 2) + little(2, 2) +
           little(44100, 4) + little(176400, 4) + little(4, 2) + little(16, 2) + "data" +
           little(pcm.size(), 4) + pcm;
}

// A data track's blocks as sectors of that size: with sync pattern, address and mode in front, unless there
// are 2336 bytes, with check bytes behind, and subchannels behind those of 2448 bytes.
inline std::string toRaw(const std::string& blocks, int mode = 1, size_t size = kSectorBytes) {
    std::string sectors;
    for (size_t i = 0; i < blocks.size(); i += 2048) {
        if (size > 2336)
            sectors += '\0' + std::string(10, '\xFF') + '\0' + big(i / 2048, 3) + static_cast<char>(mode);
        sectors += std::string(mode == 2 ? 8 : 0, 'h') + blocks.substr(i, 2048) +
                   std::string(mode == 2 ? 280 : 288, 'e') + std::string(size > kSectorBytes ? 96 : 0, 's');
    }
    return sectors;
}

// An image with chunks behind its sectors; those in front of the one with the table of contents are `more`.
inline std::string toNrg(const std::string& sectors, const std::string& name, const std::string& entries,
                         const std::string& more = {}) {
    const bool isLong = name.ends_with('X') || name.ends_with('2');
    return sectors + more + name + big(entries.size(), 4) + entries + "END!" + big(0, 4) +
           (isLong ? "NER5" : "NERO") + big(sectors.size(), isLong ? 8 : 4);
}
const std::string kDaoStart = big(0, 4) + "1234567890123" + std::string(5, '\0');
// The entry of a track from those places of the file on: its pregap, its start and its end.
inline std::string toDaoEntry(int width, size_t sectorBytes, int mode, const std::vector<size_t>& places) {
    std::string entry = "DEXXX0100001" + big(sectorBytes, 2) + static_cast<char>(mode) + std::string(3, '\0');
    for (const size_t place : places) entry += big(place, width);
    return entry;
}

inline std::string lastError() {
    return narrow(DISCIO_GetErrorMessageW(nullptr, DISCIO_GetLastError(nullptr)));
}

// A text of a track, or of the disc for -1.
inline std::u16string getText(const Discio<DISCIO_Disc>& disc, int segment,
                              int32_t text = DISCIO_TEXT_TITLE) {
    const char16_t* found = segment < 0
                                ? DISCIO_DiscAudioGetMetaDataStringW(disc.get(), text)
                                : DISCIO_DiscAudioGetSegmentMetaDataStringW(disc.get(), segment, text);
    return found ? found : u"(null)";
}

// The disc in an image, or in the first drive of the machine; null if it cannot be read.
struct SOpenDisc {
    explicit SOpenDisc(const std::string& path = {}) {
        const std::u16string image = wide(path);
        const DISCIO_Options options{sizeof options, 0, path.empty() ? nullptr : image.c_str()};
        library.reset(DISCIO_CreateEx(DISCIO_API_VERSION, &options));
        DISCIO_EnumerateDrives(library.get());
        drive.reset(DISCIO_OpenDrive(library.get(), 0));
        disc.reset(DISCIO_DriveOpenDisc(drive.get()));
    }
    // "start+length-pregap" of each track and "|" with the lead-out.
    std::string describe() const {
        std::string text;
        const int count = DISCIO_DiscGetTrackCount(disc.get());
        for (int i = 0; i < count; ++i)
            text += std::to_string(DISCIO_DiscGetTrackStartBlocks(disc.get(), i)) + "+" +
                    std::to_string(DISCIO_DiscGetTrackLengthBlocks(disc.get(), i)) + "-" +
                    std::to_string(DISCIO_DiscGetTrackPregap(disc.get(), i)) + " ";
        return text + "| " + std::to_string(DISCIO_DiscGetTrackStartBlocks(disc.get(), count));
    }
    Discio<DISCIO_PCMAudioStream> openSegment(int segment) const {
        return Discio<DISCIO_PCMAudioStream>(
            DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(disc.get(), segment));
    }
    // All samples, read in blocks of varying size; the reason of a failure behind what was read before it.
    std::string readSegment(int segment, int64_t* repairs = nullptr) const {
        const auto stream = openSegment(segment);
        if (!stream || stream->funcs->open(stream->user) != 1) return lastError();
        std::string pcm;
        std::minstd_rand random(static_cast<unsigned>(segment) + 1);
        for (int32_t delivered = 1; delivered > 0;) {
            std::string block(4 * (1 + random() % 2000), '\0');
            if (stream->funcs->read(stream->user, block.data(), static_cast<int32_t>(block.size() / 4),
                                    &delivered) != 1)
                return pcm + lastError();
            pcm.append(block, 0, 4 * static_cast<size_t>(delivered));
        }
        if (repairs) *repairs = stream->funcs->getRepairs(stream->user);
        return pcm;
    }

    Discio<DISCIO_Library> library;
    Discio<DISCIO_Drive> drive;
    Discio<DISCIO_Disc> disc;
};

} // namespace tests
