// Searches over plain arrays of code units, several at a time.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>
#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace peru::text {

// Fixed-width text as an array of its code units, aligned or not.
template <class U> struct SUnits {
    const uint8_t* data;
    U operator[](int32_t i) const {
        U unit;
        std::memcpy(&unit, data + static_cast<ptrdiff_t>(i) * static_cast<ptrdiff_t>(sizeof(U)), sizeof(U));
        return unit;
    }
    SUnits operator+(int32_t i) const {
        return {data + static_cast<ptrdiff_t>(i) * static_cast<ptrdiff_t>(sizeof(U))};
    }
};

// Units that the loops below test without a branch; long enough for the compiler to vectorise.
inline constexpr int32_t kScanBlock = 64;

// The first index at which two arrays differ, `count` if they do not.
template <class A, class B> int32_t findDifference(SUnits<A> a, SUnits<B> b, int32_t count) {
    using W = std::conditional_t<(sizeof(A) > sizeof(B)), A, B>;
    int32_t i = 0;
    for (; i + kScanBlock <= count; i += kScanBlock) {
        if constexpr (sizeof(A) == sizeof(B)) {
            if (std::memcmp((a + i).data, (b + i).data, kScanBlock * sizeof(A)) != 0) break;
        } else {
            W different = 0;
            for (int32_t k = 0; k < kScanBlock; ++k)
                different |= static_cast<W>(static_cast<W>(a[i + k]) ^ static_cast<W>(b[i + k]));
            if (different) break;
        }
    }
    while (i < count && a[i] == b[i]) ++i;
    return i;
}

// The first index of a unit, -1 if there is none.
template <class U> int32_t findUnit(SUnits<U> units, int32_t count, U wanted) {
    int32_t i = 0;
#if defined(__SSE2__)
    constexpr int32_t kLanes = 16 / sizeof(U);
    const __m128i pattern = sizeof(U) == 2 ? _mm_set1_epi16(static_cast<short>(wanted))
                                           : _mm_set1_epi32(static_cast<int>(wanted));
    auto test = [&](int32_t at) {
        __m128i block = _mm_loadu_si128(reinterpret_cast<const __m128i*>((units + at).data));
        return sizeof(U) == 2 ? _mm_cmpeq_epi16(block, pattern) : _mm_cmpeq_epi32(block, pattern);
    };
    for (; i + 4 * kLanes <= count; i += 4 * kLanes) {
        __m128i any = _mm_or_si128(_mm_or_si128(test(i), test(i + kLanes)),
                                   _mm_or_si128(test(i + 2 * kLanes), test(i + 3 * kLanes)));
        if (_mm_movemask_epi8(any)) break;
    }
    for (; i + kLanes <= count; i += kLanes)
        if (int mask = _mm_movemask_epi8(test(i)))
            return i + __builtin_ctz(static_cast<unsigned>(mask)) / static_cast<int32_t>(sizeof(U));
#endif
    for (; i < count; ++i)
        if (units[i] == wanted) return i;
    return -1;
}

// True if one of the first `count` units satisfies the test, which must not branch.
template <class U, class F> bool hasAny(SUnits<U> units, int32_t count, F&& test) {
    U found = 0;
    for (int32_t i = 0; i < count; ++i) found |= static_cast<U>(test(units[i]));
    return found != 0;
}

} // namespace peru::text
