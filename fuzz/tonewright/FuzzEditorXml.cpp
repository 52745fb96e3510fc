// Feeds arbitrary bytes to the arrangement reader: whatever is accepted must be valid numbers and URIs.
#include "peru/Errors.h"
#include "tonewright/EditorXml.h"
#include "tonewright/TrackModifierFade.h"

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <string_view>

using namespace tonewright;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    try {
        const auto tracks =
            readEditorXml(peru::CString::fromUTF8({reinterpret_cast<const char*>(data), size}));
        for (const P<CTrack>& track : tracks) {
            require(std::isfinite(track->getTrackStart()) && std::isfinite(track->getSourceStartTime()) &&
                    std::isfinite(track->getSourceEndTime()));
            track->getURI()->getAsString();
            for (int32_t i = 0; i < track->getModifierCount(); ++i) {
                const P<CTrackModifierFade> fade(track->getModifierAt(i));
                require(std::isfinite(fade->getTimestamp()) && std::isfinite(fade->getDuration()) &&
                        std::isfinite(fade->getStartValue()) && std::isfinite(fade->getEndValue()));
            }
        }
    } catch (const peru::CParseError&) {
    } catch (const peru::CURIFormatError&) {
    }
    return 0;
}
