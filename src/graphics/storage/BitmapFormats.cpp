#include "graphics/storage/BitmapFormats.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

EBitmapFormat chooseFormat(const CBitmap& bitmap, const std::string& sourceFileName, bool isLossless) {
    // The toolkit writes icons of up to 255 pixels only.
    const bool fitsIcon = bitmap.GetWidth() <= 255 && bitmap.GetHeight() <= 255;
    if (getFormatOfFile(sourceFileName) == EBitmapFormat::ico && fitsIcon) return EBitmapFormat::ico;
    if (isLossless) return EBitmapFormat::png;
    return bitmap.HasAlpha() ? EBitmapFormat::jng : EBitmapFormat::jpg;
}

P<CBitmap> tryLoadBitmap(EBitmapFormat format, std::string bytes, const std::string& source,
                         IResourceInputStore& store) {
    try {
        if (format == EBitmapFormat::none)
            throw peru::CError(
                peru::localize("graphics.Attachment.UnknownFormat", "The picture has an unknown format."));
        return peru::make<CBitmap>(format, std::move(bytes));
    } catch (const peru::CException& error) {
        reportAttachment(store, source, error);
        return {};
    }
}

void reportAttachment(IResourceInputStore& store, const std::string& source, const peru::CException& error) {
    store.Report(
        peru::localize("graphics.Attachment.LeftOut", "The attachment \"%NAME%\" is left out: %DETAILS%",
                       {{"%NAME%", peru::CString::fromUTF8(source)}, {"%DETAILS%", error.getDescription()}}));
}

} // namespace graphics
