#include "graphics/images/ImageCodec.h"

#include "graphics/animation/IAnimation.h"
#include "graphics/images/WxImages.h"
#include "peru/Errors.h"
#include "peru/gui/ImageConversion.h"
#include "peru/gui/ImageHeader.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

namespace {

using peru::gui::SImageSize;

struct SFormat {
    EBitmapFormat format;
    const char* extension;
    std::optional<SImageSize> (*readSize)(std::string_view bytes);
    bool isStored;
};

constexpr SFormat kFormats[] = {
    {EBitmapFormat::bmp, "bmp", peru::gui::readBmpSize, true},
    {EBitmapFormat::ico, "ico", peru::gui::readIconSize, true},
    {EBitmapFormat::png, "png", peru::gui::readPngSize, true},
    {EBitmapFormat::jpg, "jpg", peru::gui::readJpegSize, true},
    {EBitmapFormat::jng, "jng", peru::gui::readJngSize, true},
    {EBitmapFormat::tif, "tif", peru::gui::readTiffSize, false},
    {EBitmapFormat::gif, "gif", peru::gui::readGifSize, false},
    {EBitmapFormat::mng, "mng", peru::gui::readMngSize, false},
};

std::optional<SImageSize> readSize(EBitmapFormat format, const std::string& bytes) {
    const auto isSame = [&](const SFormat& known) { return known.format == format; };
    const auto known = std::find_if(std::begin(kFormats), std::end(kFormats), isSame);
    return known == std::end(kFormats) ? std::nullopt : known->readSize(bytes);
}

} // namespace

EBitmapFormat getFormatOfFile(const std::string& fileName) {
    const size_t dot = fileName.rfind('.');
    if (dot == std::string::npos) return EBitmapFormat::none;
    std::string ending = fileName.substr(dot + 1);
    for (char& ch : ending) ch = ch >= 'A' && ch <= 'Z' ? static_cast<char>(ch + 32) : ch;
    if (ending == "jpeg") ending = "jpg";
    for (const SFormat& known : kFormats)
        if (known.isStored && ending == known.extension) return known.format;
    return EBitmapFormat::none;
}

EBitmapFormat detectFormat(std::string_view bytes) {
    for (const SFormat& known : kFormats)
        if (known.readSize(bytes)) return known.format;
    return EBitmapFormat::none;
}

std::string getExtension(EBitmapFormat format) {
    for (const SFormat& known : kFormats)
        if (format == known.format) return known.extension;
    return {};
}

SPixelSize probeImage(EBitmapFormat format, const std::string& bytes) {
    auto size = readSize(format, bytes);
    if (!size)
        throw peru::CError(peru::localize("graphics.ImageCodec.NoHeader",
                                          "The %FORMAT% picture has no valid header.",
                                          {{"%FORMAT%", peru::CString::fromUTF8(getExtension(format))}}));
    peru::gui::checkImageSize(size->width, size->height);
    // The toolkit chooses one of the pictures in an icon.
    if (format == EBitmapFormat::ico) {
        const wxImage image = readImage(format, bytes);
        return {image.GetWidth(), image.GetHeight()};
    }
    return {static_cast<int>(size->width), static_cast<int>(size->height)};
}

std::optional<bool> probeAlpha(EBitmapFormat format, std::string_view bytes) {
    constexpr uint8_t kAlpha = 4; // a bit of the type of PNG and JNG pictures
    switch (format) {
    case EBitmapFormat::jpg:
        return false;
    case EBitmapFormat::jng:
        return bytes.size() > 24 && (static_cast<uint8_t>(bytes[24]) & kAlpha) != 0;
    case EBitmapFormat::png:
        if (bytes.size() > 25 && !(static_cast<uint8_t>(bytes[25]) & kAlpha) &&
            bytes.find("tRNS") == std::string_view::npos)
            return false;
        return std::nullopt;
    default:
        return std::nullopt;
    }
}

peru::gui::CPremultipliedImage decodeImage(EBitmapFormat format, const std::string& bytes, SPixelSize size) {
    peru::gui::CPremultipliedImage image =
        format == EBitmapFormat::gif || format == EBitmapFormat::mng
            ? peru::gui::premultiply(animation::OpenAnimation(bytes)->GetFrame(0))
            : peru::gui::premultipliedFromWxImage(readImage(format, bytes));
    if (SPixelSize{image.getWidth(), image.getHeight()} != size)
        throw peru::CError(peru::localize("graphics.ImageCodec.OtherSize",
                                          "The picture does not have the size that its header announces."));
    return image;
}

std::string encodeImage(EBitmapFormat format, const peru::gui::CPremultipliedImage& image) {
    return writeImage(format, peru::gui::toWxImage(peru::gui::unpremultiply(image)));
}

} // namespace graphics
