#include "sonora2/pictures/RGBConversion.h"

#include <algorithm>

namespace sonora2::common {

namespace {

// Operands of 16 bits, so that vector units without a multiplication of 32 bits can be used.
inline int multiply(int value, int16_t factor) {
    return static_cast<int16_t>(value) * factor;
}

inline uint32_t makePixel(int byte0, int byte1, int byte2) {
    const auto clamp = [](int value) { return static_cast<uint32_t>(std::clamp(value, 0, 255)); };
    return 0xFF000000u | clamp(byte2) << 16 | clamp(byte1) << 8 | clamp(byte0);
}

} // namespace

void convertPairsToRGB(const uint8_t* __restrict pairs, uint32_t* __restrict pixels, size_t pairCount) {
    for (size_t i = 0; i < pairCount; ++i) {
        const int d = pairs[4 * i + 1] - 128, e = pairs[4 * i + 3] - 128;
        const int byte0 = multiply(d, 409) + 128;
        const int byte1 = 128 - multiply(d, 208) - multiply(e, 100);
        const int byte2 = multiply(e, 516) + 128;
        const int first = multiply(pairs[4 * i] - 16, 298), second = multiply(pairs[4 * i + 2] - 16, 298);
        pixels[2 * i] = makePixel((first + byte0) >> 8, (first + byte1) >> 8, (first + byte2) >> 8);
        pixels[2 * i + 1] = makePixel((second + byte0) >> 8, (second + byte1) >> 8, (second + byte2) >> 8);
    }
}

void convertRowToRGB(const uint8_t* __restrict luma, const uint8_t* __restrict u, const uint8_t* __restrict v,
                     uint32_t* __restrict pixels, size_t pairCount) {
    for (size_t i = 0; i < pairCount; ++i) {
        const int blue = multiply(u[i] - 128, 16531);
        const int green = 1262464 - multiply(u[i], 3203) - multiply(v[i], 6660);
        const int red = multiply(v[i] - 128, 13074);
        const int first = multiply(luma[2 * i] - 16, 9535), second = multiply(luma[2 * i + 1] - 16, 9535);
        pixels[2 * i] = makePixel((first + blue) >> 13, (first + green) >> 13, (first + red) >> 13);
        pixels[2 * i + 1] = makePixel((second + blue) >> 13, (second + green) >> 13, (second + red) >> 13);
    }
}

void convertPlanesToRGB(const uint8_t* luma, const uint8_t* u, const uint8_t* v, uint32_t* pixels, int width,
                        int height) {
    const int columns = width / 2, rows = height / 2;
    for (int y = 0; y < height; ++y, luma += width, pixels += width) {
        const int64_t row = int64_t{std::min(y / 2, std::max(rows - 1, 0))} * columns;
        if (rows > 0) convertRowToRGB(luma, u + row, v + row, pixels, static_cast<size_t>(columns));
        // Pixels without chroma of their own.
        constexpr uint8_t kGrey = 128;
        const bool hasChroma = rows > 0 && columns > 0;
        const int64_t last = row + columns - 1;
        for (int x = rows > 0 ? 2 * columns : 0; x < width; ++x) {
            const uint8_t pair[] = {luma[x], luma[x]};
            uint32_t converted[2];
            convertRowToRGB(pair, hasChroma ? u + last : &kGrey, hasChroma ? v + last : &kGrey, converted, 1);
            pixels[x] = converted[0];
        }
    }
}

void splitChroma(const uint8_t* __restrict interleaved, uint8_t* __restrict u, uint8_t* __restrict v,
                 size_t count) {
    for (size_t i = 0; i < count; ++i) {
        u[i] = interleaved[2 * i];
        v[i] = interleaved[2 * i + 1];
    }
}

} // namespace sonora2::common
