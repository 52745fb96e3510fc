// Arbitrary bytes as a picture of every format.
#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    peru::gui::setMaximalPixels(1'000'000); // large pictures are slow to decode, and show nothing more
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    for (const auto format :
         {EBitmapFormat::png, EBitmapFormat::jpg, EBitmapFormat::jng, EBitmapFormat::bmp, EBitmapFormat::ico,
          EBitmapFormat::tif, EBitmapFormat::gif, EBitmapFormat::mng}) {
        try {
            decodeImage(format, bytes, probeImage(format, bytes));
        } catch (const peru::CException&) {
        }
    }
    return 0;
}
