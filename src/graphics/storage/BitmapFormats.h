// How stores choose the format of a bitmap.
#pragma once

#include "graphics/images/ImageCodec.h"
#include "graphics/storage/IResourceStores.h"
#include "peru/Exception.h"

namespace graphics {

// Icons remain icons; otherwise PNG without loss, JNG for transparency and JPEG for the rest.
EBitmapFormat chooseFormat(const CBitmap& bitmap, const std::string& sourceFileName, bool isLossless);
// Empty, with a report that names the source, if the bytes are not a picture.
P<CBitmap> tryLoadBitmap(EBitmapFormat format, std::string bytes, const std::string& source,
                         IResourceInputStore& store);
// Reports an attachment that is left out.
void reportAttachment(IResourceInputStore& store, const std::string& source, const peru::CException& error);

} // namespace graphics
