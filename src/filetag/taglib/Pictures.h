// The pictures in the tag of a file, whatever its format.
#pragma once

#include <tbytevector.h>
#include <tfile.h>
#include <tstring.h>

#include <vector>

namespace filetag::taglib {

struct SPicture {
    TagLib::ByteVector data;
    TagLib::String mimeType;
    TagLib::String description;
    int type = 0; // the number of the ID3v2 APIC frame
    int width = 0;
    int height = 0;
    int colorDepth = 0;
    int colorCount = 0;
};

std::vector<SPicture> readPictures(TagLib::File& file);
// Replaces all pictures. Omits those that the format cannot hold.
void writePictures(TagLib::File& file, const std::vector<SPicture>& pictures);

} // namespace filetag::taglib
