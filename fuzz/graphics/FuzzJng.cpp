// Arbitrary chunks as a JNG picture.
#include "Chunks.h"
#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    peru::gui::setMaximalPixels(100'000);
    const std::string bytes = repairChecksums(data, size);
    try {
        decodeImage(EBitmapFormat::jng, bytes, probeImage(EBitmapFormat::jng, bytes));
    } catch (const peru::CException&) {
    }
    return 0;
}
