// The settings that a format uses.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

#include <cstdint>

namespace sonora2::common {

// Optional; found by an interface cast on an audio format. A format without it is taken to use all settings.
class SONORA2_API IFormatSettings : public virtual peru::IBase {
public:
    enum ESetting : uint32_t {
        kQuality = 1,
        kBitRate = 2,     // and its limits
        kSampleWidth = 4, // files store samples of that width
        kAllSettings = 7
    };
    // A combination of ESetting; the same in every state.
    virtual uint32_t getUsedSettings() = 0;
};

} // namespace sonora2::common
