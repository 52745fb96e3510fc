#include "peru/gui/ImageLimits.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <atomic>
#include <cstdlib>

namespace peru::gui {

namespace {

constexpr int64_t kMaximalSide = 32767; // of cairo's surfaces

std::atomic<int64_t> s_pixels = 0, s_memory = 0; // 0: as the environment says

int64_t getSetting(const std::atomic<int64_t>& value, const char* variable, int64_t unit,
                   int64_t defaultValue) {
    if (value > 0) return value;
    const char* const text = std::getenv(variable);
    const int64_t wanted = text ? std::strtoll(text, nullptr, 10) : 0;
    return wanted > 0 && wanted < INT64_MAX / unit ? wanted * unit : defaultValue;
}

} // namespace

int64_t getMaximalPixels() {
    return getSetting(s_pixels, "TONEWRIGHT_IMAGE_MEGAPIXELS", 1'000'000, kDefaultMaximalPixels);
}

void setMaximalPixels(int64_t count) {
    s_pixels = count;
}

void checkImageSize(int64_t width, int64_t height) {
    if (width < 1 || height < 1 || width > kMaximalSide || height > kMaximalSide ||
        width * height > getMaximalPixels())
        throw CError(localize("graphics.ImageCodec.TooLarge",
                              "A picture of %WIDTH% x %HEIGHT% pixels is too large.",
                              {{"%WIDTH%", format("%d", width)}, {"%HEIGHT%", format("%d", height)}}));
}

int64_t getImageMemory() {
    return getSetting(s_memory, "TONEWRIGHT_IMAGE_MEMORY", 1 << 20, 256 << 20);
}

void setImageMemory(int64_t bytes) {
    s_memory = bytes;
}

} // namespace peru::gui
