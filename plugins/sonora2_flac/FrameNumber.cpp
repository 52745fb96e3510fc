#include "sonora2_flac/FrameNumber.h"

#include <array>

namespace sonora2::plugins::flac {

namespace {

constexpr size_t kNumberOffset = 4;
constexpr size_t kFooterBytes = 2;
constexpr uint32_t kHeaderPolynomial = 0x107;  // x^8 + x^2 + x + 1
constexpr uint32_t kFramePolynomial = 0x18005; // x^16 + x^15 + x^2 + 1

constexpr uint32_t shiftOne(uint32_t value, uint32_t polynomial, int degree) {
    value <<= 1;
    return value >> degree & 1 ? value ^ polynomial : value;
}

uint32_t getChecksum(const uint8_t* bytes, size_t size, uint32_t polynomial, int degree) {
    uint32_t crc = 0;
    for (size_t i = 0; i < size; ++i) {
        crc ^= uint32_t{bytes[i]} << (degree - 8);
        for (int bit = 0; bit < 8; ++bit) crc = shiftOne(crc, polynomial, degree);
    }
    return crc;
}

uint32_t multiply(uint32_t a, uint32_t b) {
    uint32_t product = 0;
    for (int bit = 15; bit >= 0; --bit) {
        product = shiftOne(product, kFramePolynomial, 16);
        if (a >> bit & 1) product ^= b;
    }
    return product;
}

// What a checksum becomes after that many zero bytes.
uint32_t appendZeros(uint32_t crc, size_t bytes) {
    for (uint32_t power = 0x100; bytes > 0;
         bytes >>= 1, power = multiply(power, power)) // x^8, x^16, x^32, ...
        if (bytes & 1) crc = multiply(crc, power);
    return crc;
}

// The extension of UTF-8 to 36 bits.
size_t putNumber(uint8_t* at, uint64_t number) {
    if (number < 0x80) {
        *at = static_cast<uint8_t>(number);
        return 1;
    }
    int continuations = 1;
    while (number >> (6 * continuations + (6 - continuations)) != 0) ++continuations;
    const uint32_t prefix = 0xFF80u >> continuations & 0xFF;
    at[0] = static_cast<uint8_t>(prefix | number >> (6 * continuations));
    for (int i = 1; i <= continuations; ++i)
        at[i] = static_cast<uint8_t>(0x80 | (number >> (6 * (continuations - i)) & 0x3F));
    return static_cast<size_t>(continuations) + 1;
}

size_t getNumberBytes(uint8_t first) {
    size_t ones = 0;
    while (first << ones & 0x80) ++ones;
    return ones == 0 ? 1 : ones;
}

// Bytes between the number and the checksum of the header: sizes and rates that have no code of their own.
size_t getExtraBytes(const uint8_t* frame) {
    const int blockSize = frame[2] >> 4, rate = frame[2] & 0xF;
    return (blockSize == 6   ? 1
            : blockSize == 7 ? 2
                             : 0) +
           (rate == 12                 ? 1
            : rate == 13 || rate == 14 ? 2
                                       : 0);
}

} // namespace

void appendRenumbered(std::vector<uint8_t>& out, const uint8_t* frame, size_t size, uint64_t number) {
    const size_t oldNumberBytes = getNumberBytes(frame[kNumberOffset]);
    const size_t extra = getExtraBytes(frame);
    const size_t oldHeader = kNumberOffset + oldNumberBytes + extra + 1;

    std::array<uint8_t, 16> header;
    for (size_t i = 0; i < kNumberOffset; ++i) header[i] = frame[i];
    size_t headerSize = kNumberOffset + putNumber(&header[kNumberOffset], number);
    for (size_t i = 0; i < extra; ++i) header[headerSize++] = frame[kNumberOffset + oldNumberBytes + i];
    header[headerSize] = static_cast<uint8_t>(getChecksum(header.data(), headerSize, kHeaderPolynomial, 8));
    ++headerSize;

    // A checksum is linear: the headers' share in it is exchanged without reading the sound between.
    const size_t sound = size - oldHeader - kFooterBytes;
    const uint32_t difference = getChecksum(frame, oldHeader, kFramePolynomial, 16) ^
                                getChecksum(header.data(), headerSize, kFramePolynomial, 16);
    const uint32_t crc = (uint32_t{frame[size - 2]} << 8 | frame[size - 1]) ^ appendZeros(difference, sound);

    out.insert(out.end(), header.begin(), header.begin() + static_cast<ptrdiff_t>(headerSize));
    out.insert(out.end(), frame + oldHeader, frame + size - kFooterBytes);
    out.push_back(static_cast<uint8_t>(crc >> 8));
    out.push_back(static_cast<uint8_t>(crc));
}

} // namespace sonora2::plugins::flac
