#include "sonora2/tracks/MixSamples.h"

namespace sonora2::audio {

// Branch-free and in 16-bit lanes, so that the compiler vectorises it by eight. All arithmetic is modulo
// 2^16; the final sum is in range, so intermediate wrap-around cancels out.
void mixSamples(const int16_t* __restrict samples, int16_t* __restrict sum, size_t count) {
    for (size_t i = 0; i < count; ++i) {
        const int16_t a = samples[i], b = sum[i];
        const auto high = static_cast<uint16_t>((int32_t{a} * b) >> 16);
        const auto low =
            static_cast<uint16_t>(static_cast<uint32_t>(static_cast<uint16_t>(a)) * static_cast<uint16_t>(b));
        // The product is h * 2^15 + l: h is its quotient by 32768, and since h * 2^15 + l is
        // h * 32767 + (h + l), where h + l is below 2 * 32767, the quotient by 32767 is h or one more.
        const auto h = static_cast<uint16_t>(high << 1 | low >> 15);
        const auto l = static_cast<uint16_t>(low & 0x7FFF);
        const auto q = static_cast<uint16_t>(h + (static_cast<uint16_t>(h + l + 1) >> 15));
        // All bits set if both are negative, or if neither is; a product of 0 needs no correction.
        const auto negative = static_cast<uint16_t>((a & b) >> 15);
        const auto positive = static_cast<uint16_t>(~((a | b) >> 15));
        sum[i] = static_cast<int16_t>(static_cast<uint16_t>(
            static_cast<uint16_t>(a) + static_cast<uint16_t>(b) + (h & negative) - (q & positive)));
    }
}

} // namespace sonora2::audio
