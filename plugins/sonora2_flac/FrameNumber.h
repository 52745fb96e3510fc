// Changes the number in the header of a FLAC frame.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace sonora2::plugins::flac {

// Appends the frame to `out` with that number and with both checksums to match. The frame is one of a stream
// with blocks of equal size, and is whole. Source: RFC 9639, sections 9.1 and 9.3.
void appendRenumbered(std::vector<uint8_t>& out, const uint8_t* frame, size_t size, uint64_t number);

} // namespace sonora2::plugins::flac
