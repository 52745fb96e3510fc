// What the faulty plug-in does instead of its work.
#pragma once

#include <string>

namespace faulty {

// The names of the faults; the attempts of a hostile plug-in throw a CSonoraError with "refused" or
// "SUCCEEDED" and the attempt. Their victims, a file and a socket, are in the environment.
inline constexpr const char* kVictimFile = "TONEWRIGHT_TEST_VICTIM_FILE";
inline constexpr const char* kVictimSocket = "TONEWRIGHT_TEST_VICTIM_SOCKET";

// Does nothing if there is no fault of that name.
void commit(const std::string& fault);

} // namespace faulty
