#include "codecs/AvErrors.h"

#include "peru/strings/IStringLocalizer.h"

extern "C" {
#include <libavutil/error.h>
}

namespace sonora2::plugins::av {

using peru::localize;

P<peru::IString> describe(int error) {
    switch (error) {
    case AVERROR_INVALIDDATA:
        return localize("sonora2.av.Damaged", "it is damaged or has another format");
    case AVERROR_DECODER_NOT_FOUND:
    case AVERROR_PATCHWELCOME:
        return localize("sonora2.av.UnknownCodec", "there is no decoder for it");
    default:
        char text[AV_ERROR_MAX_STRING_SIZE] = {};
        av_strerror(error, text, sizeof(text));
        return peru::CString::fromUTF8(text);
    }
}

void failToOpen(const SMediaFile& file, const P<peru::IString>& reason) {
    throw common::CSonoraError(localize("sonora2.av.CouldNotOpen", "could not open %FILE%: %MSG%",
                                        {{"%FILE%", file.getDisplayName()}, {"%MSG%", reason}}));
}

void failToWrite(const SMediaFile& file, const P<peru::IString>& reason) {
    throw common::CSonoraError(localize("sonora2.av.CouldNotWrite", "could not write %FILE%: %MSG%",
                                        {{"%FILE%", file.getDisplayName()}, {"%MSG%", reason}}));
}

void failAt(const SMediaFile& file, double seconds, const P<peru::IString>& reason) {
    throw common::CSonoraError(localize(
        "sonora2.av.CouldNotDecode", "could not decode %FILE% at %TIME% seconds: %MSG%",
        {{"%FILE%", file.getDisplayName()}, {"%TIME%", peru::format("%.3f", seconds)}, {"%MSG%", reason}}));
}

} // namespace sonora2::plugins::av
