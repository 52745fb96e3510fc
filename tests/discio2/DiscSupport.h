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

// The disc in an image, null if it cannot be read.
struct SOpenDisc {
    explicit SOpenDisc(const std::string& path) {
        const std::u16string image = wide(path);
        const DISCIO_Options options{sizeof options, 0, image.c_str()};
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
    // All samples, read in blocks of varying size.
    std::string readSegment(int segment) const {
        const auto stream = openSegment(segment);
        if (!stream || stream->funcs->open(stream->user) != 1) return "cannot be opened";
        std::string pcm;
        std::minstd_rand random(static_cast<unsigned>(segment) + 1);
        for (int32_t delivered = 1; delivered > 0;) {
            std::string block(4 * (1 + random() % 2000), '\0');
            if (stream->funcs->read(stream->user, block.data(), static_cast<int32_t>(block.size() / 4),
                                    &delivered) != 1)
                return pcm + "cannot be read";
            pcm.append(block, 0, 4 * static_cast<size_t>(delivered));
        }
        return pcm;
    }
    std::string getError() const {
        return narrow(DISCIO_GetErrorMessageW(library.get(), DISCIO_GetLastError(library.get())));
    }

    Discio<DISCIO_Library> library;
    Discio<DISCIO_Drive> drive;
    Discio<DISCIO_Disc> disc;
};

} // namespace tests
