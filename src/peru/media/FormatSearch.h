// Finds a format that a device supports.
#pragma once

#include "peru/media/AudioFormat.h"

#include <functional>

namespace peru::media {

using FormatTest = std::function<bool(const CAudioFormat&)>;

// Returns the wanted format if the test accepts it, otherwise the nearest accepted one with the same sample
// width. The candidates are the common sample rates and the default one, then the common channel counts up to
// `maxChannelCount`; the nearest comes first and the higher of two equally near ones. Empty if none is
// accepted.
PERU_MEDIA_API P<CAudioFormat> findNearestFormat(const P<CAudioFormat>& wanted, int32_t maxChannelCount,
                                                 int32_t defaultSampleRate, const FormatTest& isTaken);

} // namespace peru::media
