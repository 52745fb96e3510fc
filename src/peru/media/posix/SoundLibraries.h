// The libraries that the engine uses.
#pragma once

namespace peru::media::posix {

// Turns off the messages that these libraries print to standard error about every component they cannot find.
// Applies to all other uses in this process as well. Call before the engine starts.
void silenceSoundLibraries();

// Whether the ALSA configuration defines one of the two devices without which the engine aborts the process.
// Throws CMediaException if the configuration cannot be read. True if ALSA is not loaded.
bool hasConfiguredDevices();

} // namespace peru::media::posix
