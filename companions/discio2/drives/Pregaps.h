// Pregaps between audio tracks. The table of contents does not record them, the subchannel does.
#pragma once

#include "Medium.h"

#include <functional>
#include <optional>

namespace discio {

// What the subchannel of a block says.
struct SBlockPlace {
    int track = 0; // as a number, or in BCD: drives differ
    int index = 0; // 0 in a pregap
};
// Nothing for a block whose subchannel holds something else, or cannot be read.
using ReadPlace = std::function<std::optional<SBlockPlace>(int32_t block)>;

// The blocks before `start`, where the track of that number starts, that belong to the track. `previous` is
// the start of the track before. Empty if the subchannel cannot be read there.
std::optional<int32_t> findPregap(int number, int32_t start, int32_t previous, const ReadPlace& read);

} // namespace discio
