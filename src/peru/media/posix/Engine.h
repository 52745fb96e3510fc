// Loads the sound engine.
#pragma once

namespace peru::media::posix {

// The engine and the sound libraries behind it are loaded at the first use of a device, so that programs
// without sound neither map nor need them. This does it now. Throws CMediaException.
void loadEngine();

} // namespace peru::media::posix
