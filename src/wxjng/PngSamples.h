// The compressed samples of PNG pictures, which JNG and MNG files contain.
#pragma once

#include "wxjng/Jpeg.h"

class wxImage;

namespace wxjng {

struct SPngData {
    bool hasAlpha; // otherwise three channels
    std::string idat;
};

// Grey samples of 8 bits. Throws CError.
std::string encodeGreyIdat(const SSamples& picture);
// Colours of 8 bits, with alpha if the image has it. Throws CError.
SPngData encodeColourIdat(const wxImage& image);
// Samples of 1 to 16 bits, brought to 8 bits. Throws CError if the data are damaged or too short.
SSamples decodeGreyIdat(const std::string& idat, int width, int height, int depth);

} // namespace wxjng
