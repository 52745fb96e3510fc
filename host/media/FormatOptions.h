// The output format that the user asks for.
#pragma once

#include <optional>

namespace host {

struct SFormatOptions {
    std::optional<int> rate;
    std::optional<int> channels;
    std::optional<int> bits;
    std::optional<double> quality; // 0.0 to 1.0
    int bitRate = 0;               // bits per second
    int minBitRate = 0;
    int maxBitRate = 0;
};

} // namespace host
