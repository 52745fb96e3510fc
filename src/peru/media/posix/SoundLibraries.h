// The libraries that the engine stands on.
#pragma once

namespace peru::media::posix {

// They write to standard error whatever they could not find, on every machine that lacks something. From now
// on they keep quiet, for all that this process does with them. Before the engine starts.
void silenceSoundLibraries();

// Whether ALSA has a device to offer, be it of the configuration alone. The engine ends the process when it
// has none. Throws CMediaException when the configuration cannot be read. True where there is no ALSA.
bool hasConfiguredDevices();

} // namespace peru::media::posix
