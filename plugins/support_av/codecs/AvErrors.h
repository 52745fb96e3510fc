// Messages about media files, in the user's language.
#pragma once

#include "support/MediaFile.h"

namespace sonora2::plugins::av {

P<peru::IString> describe(int error); // a code of libav

[[noreturn]] void failToOpen(const SMediaFile& file, const P<peru::IString>& reason);
[[noreturn]] void failToWrite(const SMediaFile& file, const P<peru::IString>& reason);
[[noreturn]] void failAt(const SMediaFile& file, double seconds, const P<peru::IString>& reason);

} // namespace sonora2::plugins::av
