// The output format that the user asks for.
#pragma once

#include <filesystem>
#include <optional>
#include <stdexcept>

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

// Options that contradict the type of the output, which is known only once the library has started.
class CUsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// Throws CUsageError if files with the target's extension ignore one of the options. An extension that
// nothing writes is not an error here.
void requireEffect(const SFormatOptions& options, const std::filesystem::path& target);

} // namespace host
