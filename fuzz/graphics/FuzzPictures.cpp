// Arbitrary bytes as a picture of every format.
#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    for (const auto format : {EBitmapFormat::png, EBitmapFormat::jpg, EBitmapFormat::jng, EBitmapFormat::bmp,
                              EBitmapFormat::ico}) {
        try {
            const SPixelSize pixels = probeImage(format, bytes);
            // Large pictures are slow to decode, and show nothing more.
            if (int64_t{pixels.width} * pixels.height < 1'000'000) decodeImage(format, bytes, pixels);
        } catch (const peru::CException&) {
        }
    }
    return 0;
}
