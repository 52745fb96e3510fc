// Writes projects to the media of drives.
#pragma once

#include "projects/VirtualAudioDisc.h"
#include "projects/VirtualDataDisc.h"
#include "writing/Progress.h"

namespace discio {

struct SDiscSettings {
    bool isDummy = false;
    bool mayBlank = false; // a rewritable medium that is not empty
    bool isVerified = false;
    bool withTexts = false;
    double speed = 0; // 0: the fastest
};

// `device` is the path of an optical drive. All throw CDiscError.
void writeAudioDisc(const CVirtualAudioDisc& disc, const std::string& device, const SDiscSettings& settings,
                    const CProgress& progress);
void writeDataDisc(const CVirtualDataDisc& disc, const std::string& device, const SDiscSettings& settings,
                   const CProgress& progress);
void blankDisc(const std::string& device, bool whole, const CProgress& progress);

} // namespace discio
