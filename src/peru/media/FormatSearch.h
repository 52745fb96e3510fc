// Finds a format that a device takes.
#pragma once

#include "peru/media/AudioFormat.h"

#include <functional>

namespace peru::media {

using FormatTest = std::function<bool(const CAudioFormat&)>;

// The wanted format where the test passes it, else the nearest one with the same width: of the usual rates,
// the wanted and the default one the nearest, the higher of two as near; of the usual channel counts up to
// `maxChannelCount` the nearest, again the higher of two. Empty when the test passes none.
PERU_MEDIA_API P<CAudioFormat> findNearestFormat(const P<CAudioFormat>& wanted, int32_t maxChannelCount,
                                                 int32_t defaultSampleRate, const FormatTest& isTaken);

} // namespace peru::media
