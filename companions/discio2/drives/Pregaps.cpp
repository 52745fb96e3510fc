#include "drives/Pregaps.h"

#include <algorithm>

namespace discio {

namespace {

// One in a hundred blocks has the catalogue number, and another one the track's code, instead of the
// position.
constexpr int32_t kTries = 4;

} // namespace

std::optional<int32_t> findPregap(int number, int32_t start, int32_t previous, const ReadPlace& read) {
    const auto isInPregap = [&](int32_t block) -> std::optional<bool> {
        for (int32_t i = block; i > std::max(block - kTries, previous); --i)
            if (const std::optional<SBlockPlace> place = read(i)) {
                const bool isTrack =
                    place->track == number || place->track == (number / 10 << 4 | number % 10);
                return isTrack && place->index == 0;
            }
        return std::nullopt;
    };
    std::optional<bool> isInside = isInPregap(start - 1);
    if (!isInside) return std::nullopt;
    if (!*isInside) return 0;
    // Most pregaps are short: the steps double first, then the interval is halved.
    int32_t inside = start - 1, outside = previous;
    for (int32_t step = 1; start - 1 - step > previous; step *= 2) {
        isInside = isInPregap(start - 1 - step);
        if (!isInside.value_or(false)) {
            outside = start - 1 - step;
            break;
        }
        inside = start - 1 - step;
    }
    while (inside - outside > 1) {
        const int32_t middle = outside + (inside - outside) / 2;
        (isInPregap(middle).value_or(false) ? inside : outside) = middle;
    }
    return start - inside;
}

} // namespace discio
