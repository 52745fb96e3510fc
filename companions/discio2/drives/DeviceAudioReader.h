// Audio of an optical drive, read with overlap and re-reads.
#pragma once

#include "Medium.h"

namespace discio {

// For a track of the medium with those contents. Throws CDiscError if another medium is in the drive now.
std::unique_ptr<IAudioReader> createDeviceAudioReader(const std::string& path,
                                                      const STableOfContents& contents, const STrack& track);

} // namespace discio
