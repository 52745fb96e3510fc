// ImageMagick, which judges files of pictures.
#pragma once

#include "peru/gui/RGBAImage.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <random>
#include <sstream>

namespace tests {

// Runs `convert` with arguments separated by blanks in a folder. Its output.
inline std::string runImageTool(const std::filesystem::path& folder, const std::string& arguments) {
    std::vector<std::string> command = {"convert"};
    std::istringstream words(arguments);
    for (std::string word; words >> word;) command.push_back(word);
    const auto result = CProcess(command, folder.string()).wait();
    EXPECT_EQ(result.exitCode, 0) << arguments << "\n" << result.err;
    return result.out;
}

// The pixels of a file, of all its frames one after the other, as 0xAARRGGBB.
inline std::vector<uint32_t> readByImageTool(const std::filesystem::path& folder,
                                             const std::string& arguments) {
    const std::string bytes = runImageTool(folder, arguments + " -depth 8 rgba:-");
    std::vector<uint32_t> pixels(bytes.size() / 4);
    for (size_t i = 0; i < pixels.size(); ++i) {
        const auto at = [&](size_t offset) { return uint32_t{static_cast<uint8_t>(bytes[4 * i + offset])}; };
        pixels[i] = at(3) << 24 | at(0) << 16 | at(1) << 8 | at(2);
    }
    return pixels;
}

// The largest difference of a channel. Colours of transparent pixels are compared if `isExact`.
inline int compare(const std::vector<uint32_t>& left, const std::vector<uint32_t>& right,
                   bool isExact = false) {
    if (left.size() != right.size()) return 256;
    int largest = 0;
    for (size_t i = 0; i < left.size(); ++i)
        for (const int shift : {24, 16, 8, 0}) {
            if (!isExact && shift < 24 && left[i] >> 24 == 0 && right[i] >> 24 == 0) continue;
            const auto channel = [&](uint32_t pixel) { return static_cast<int>(pixel >> shift & 255); };
            largest = std::max(largest, std::abs(channel(left[i]) - channel(right[i])));
        }
    return largest;
}

// Runs a function on parts of the bytes and on copies with changed bits; it may only throw CError.
template <class Function> void damage(const std::string& bytes, const Function& read) {
    std::mt19937 random(6);
    for (size_t length = 0; length < bytes.size(); length += 1 + bytes.size() / 60)
        read(bytes.substr(0, length));
    for (int i = 0; i < 100; ++i) {
        std::string flipped = bytes;
        flipped[random() % bytes.size()] ^= static_cast<char>(1 << random() % 8);
        read(flipped);
    }
}

} // namespace tests
