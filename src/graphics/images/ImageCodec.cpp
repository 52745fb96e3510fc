#include "graphics/images/ImageCodec.h"

#include "graphics/images/Jng.h"
#include "graphics/images/WxImages.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <optional>

namespace graphics {

namespace {

struct SFormat {
    EBitmapFormat format;
    const char* extension;
};

constexpr SFormat kFormats[] = {
    {EBitmapFormat::bmp, "bmp"}, {EBitmapFormat::ico, "ico"}, {EBitmapFormat::png, "png"},
    {EBitmapFormat::jpg, "jpg"}, {EBitmapFormat::jng, "jng"},
};

uint32_t byteAt(const std::string& bytes, size_t offset) {
    return static_cast<uint8_t>(bytes[offset]);
}

uint32_t bigEndian(const std::string& bytes, size_t offset, int count) {
    uint32_t value = 0;
    for (int i = 0; i < count; ++i) value = value << 8 | byteAt(bytes, offset + static_cast<size_t>(i));
    return value;
}

// Signed, of four bytes.
int64_t littleEndian(const std::string& bytes, size_t offset) {
    uint32_t value = 0;
    for (size_t i = 4; i-- > 0;) value = value << 8 | byteAt(bytes, offset + i);
    return static_cast<int32_t>(value);
}

struct SHeaderSize {
    int64_t width;
    int64_t height;
};

// PNG and JNG: signature, length and type of the first chunk, then the size.
std::optional<SHeaderSize> probeChunks(const std::string& bytes, std::string_view signature,
                                       std::string_view type) {
    if (bytes.size() < 24 || !bytes.starts_with(signature) || bytes.compare(12, 4, type) != 0) return {};
    return SHeaderSize{bigEndian(bytes, 16, 4), bigEndian(bytes, 20, 4)};
}

// The first start-of-frame segment.
std::optional<SHeaderSize> probeJpeg(const std::string& bytes) {
    if (!bytes.starts_with("\xFF\xD8")) return {};
    for (size_t at = 2; at + 9 <= bytes.size();) {
        if (byteAt(bytes, at) != 0xFF) return {};
        const uint32_t marker = byteAt(bytes, at + 1);
        if (marker == 0xFF) { // padding
            ++at;
            continue;
        }
        const bool isTable = marker == 0xC4 || marker == 0xC8 || marker == 0xCC;
        if (marker >= 0xC0 && marker <= 0xCF && !isTable)
            return SHeaderSize{bigEndian(bytes, at + 7, 2), bigEndian(bytes, at + 5, 2)};
        at += 2 + bigEndian(bytes, at + 2, 2);
    }
    return {};
}

std::optional<SHeaderSize> probeBmp(const std::string& bytes) {
    if (bytes.size() < 26 || !bytes.starts_with("BM")) return {};
    return SHeaderSize{littleEndian(bytes, 18),
                       std::abs(littleEndian(bytes, 22))}; // a negative height means top to bottom
}

// The largest picture is decoded to learn its size, once no picture of the file announces to be large.
std::optional<SHeaderSize> probeIcon(const std::string& bytes) {
    constexpr size_t kHeader = 6, kEntry = 16, kMaximalCount = 64;
    constexpr int64_t kMaximalSide = 1024;
    if (bytes.size() < kHeader + kEntry) return {};
    const size_t count = byteAt(bytes, 4) | byteAt(bytes, 5) << 8;
    if (count < 1 || count > kMaximalCount || bytes.size() < kHeader + count * kEntry) return {};
    for (size_t i = 0; i < count; ++i) {
        const int64_t offset = littleEndian(bytes, kHeader + i * kEntry + 12);
        if (offset < 0 || offset + 40 > static_cast<int64_t>(bytes.size())) return {};
        // The height includes that of the mask.
        const int64_t width = littleEndian(bytes, static_cast<size_t>(offset) + 4);
        const int64_t height = littleEndian(bytes, static_cast<size_t>(offset) + 8);
        if (width < 1 || height < 1 || width > kMaximalSide || height > 2 * kMaximalSide) return {};
    }
    const wxImage image = readImage(EBitmapFormat::ico, bytes);
    return SHeaderSize{image.GetWidth(), image.GetHeight()};
}

std::optional<SHeaderSize> probe(EBitmapFormat format, const std::string& bytes) {
    switch (format) {
    case EBitmapFormat::png:
        return probeChunks(bytes, "\x89PNG\r\n\x1A\n", "IHDR");
    case EBitmapFormat::jng:
        return probeChunks(bytes, kJngSignature, "JHDR");
    case EBitmapFormat::jpg:
        return probeJpeg(bytes);
    case EBitmapFormat::bmp:
        return probeBmp(bytes);
    case EBitmapFormat::ico:
        return probeIcon(bytes);
    default:
        return {};
    }
}

} // namespace

EBitmapFormat getFormatOfFile(const std::string& fileName) {
    const size_t dot = fileName.rfind('.');
    if (dot == std::string::npos) return EBitmapFormat::none;
    std::string ending = fileName.substr(dot + 1);
    for (char& ch : ending) ch = ch >= 'A' && ch <= 'Z' ? static_cast<char>(ch + 32) : ch;
    if (ending == "jpeg") ending = "jpg";
    for (const SFormat& known : kFormats)
        if (ending == known.extension) return known.format;
    return EBitmapFormat::none;
}

std::string getExtension(EBitmapFormat format) {
    for (const SFormat& known : kFormats)
        if (format == known.format) return known.extension;
    return {};
}

SPixelSize probeImage(EBitmapFormat format, const std::string& bytes) {
    const auto size = probe(format, bytes);
    if (!size || size->width < 1 || size->height < 1)
        throw peru::CError(peru::localize("graphics.ImageCodec.NoHeader",
                                          "The %FORMAT% picture has no valid header.",
                                          {{"%FORMAT%", peru::CString::fromUTF8(getExtension(format))}}));
    if (size->width > 65535 || size->height > 65535 || size->width * size->height > kMaximalPixels)
        throw peru::CError(peru::localize(
            "graphics.ImageCodec.TooLarge", "A picture of %WIDTH% x %HEIGHT% pixels is too large.",
            {{"%WIDTH%", peru::format("%d", size->width)}, {"%HEIGHT%", peru::format("%d", size->height)}}));
    return {static_cast<int>(size->width), static_cast<int>(size->height)};
}

std::vector<uint32_t> decodeImage(EBitmapFormat format, const std::string& bytes, SPixelSize size) {
    wxImage image = format == EBitmapFormat::jng ? decodeJng(bytes) : readImage(format, bytes);
    if (SPixelSize{image.GetWidth(), image.GetHeight()} != size)
        throw peru::CError(peru::localize("graphics.ImageCodec.OtherSize",
                                          "The picture does not have the size that its header announces."));
    if (image.HasMask() && !image.HasAlpha()) image.InitAlpha();
    const size_t count = static_cast<size_t>(size.width) * static_cast<size_t>(size.height);
    const uint8_t* const colours = image.GetData();
    const uint8_t* const alphas = image.HasAlpha() ? image.GetAlpha() : nullptr;
    std::vector<uint32_t> pixels(count);
    for (size_t i = 0; i < count; ++i) {
        const uint32_t alpha = alphas ? alphas[i] : 255;
        const auto channel = [&](size_t offset) { return (colours[i * 3 + offset] * alpha + 127) / 255; };
        pixels[i] = alpha << 24 | channel(0) << 16 | channel(1) << 8 | channel(2);
    }
    return pixels;
}

std::string encodeImage(EBitmapFormat format, const std::vector<uint32_t>& pixels, SPixelSize size) {
    wxImage image(size.width, size.height, false);
    if (!image.IsOk()) throw peru::CError("Out of memory");
    image.SetAlpha();
    bool hasAlpha = false;
    for (size_t i = 0; i < pixels.size(); ++i) {
        const uint32_t alpha = pixels[i] >> 24;
        hasAlpha = hasAlpha || alpha != 255;
        image.GetAlpha()[i] = static_cast<uint8_t>(alpha);
        for (size_t offset = 0; offset < 3; ++offset) {
            const uint32_t channel = pixels[i] >> (16 - 8 * offset) & 255;
            const uint32_t colour = alpha ? (channel * 255 + alpha / 2) / alpha : 0;
            image.GetData()[i * 3 + offset] = static_cast<uint8_t>(std::min(colour, 255u));
        }
    }
    if (format == EBitmapFormat::jng) return encodeJng(image);
    if (!hasAlpha) image.ClearAlpha();
    return writeImage(format, image);
}

} // namespace graphics
