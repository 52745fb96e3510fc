// Gives the disc access library the samples of a source.
#pragma once

#include <tonewright/discio2.h>

namespace tonewright::exports {

// Functions for a stream whose user data is a peru::CInstanceWrapper with a CSampleReader, which belongs to
// the stream. Each holds the application's service lock, since the library calls them on whatever thread
// writes the disc. Failures are reported like those of exports.
extern const DISCIO_PCMAudioStreamFuncs kSampleReaderFuncs;

} // namespace tonewright::exports
