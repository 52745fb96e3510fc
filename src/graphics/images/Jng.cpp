#include "graphics/images/Jng.h"

#include "graphics/images/ImageCodec.h"
#include "graphics/images/WxImages.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cstring>
#include <zlib.h>

namespace graphics {

namespace {

constexpr std::string_view kPngSignature("\x89PNG\r\n\x1A\n", 8);
constexpr uint8_t kColourAlpha = 14;   // the type of a picture with colour and alpha
constexpr uint8_t kAlphaByDeflate = 0; // as in a PNG file
constexpr uint8_t kAlphaByJpeg = 8;

[[noreturn]] void fail() {
    throw peru::CError(peru::localize("graphics.Jng.Damaged", "The JNG picture is damaged."));
}

std::string bigEndian(uint32_t value) {
    std::string bytes;
    for (const int shift : {24, 16, 8, 0}) bytes += static_cast<char>(value >> shift);
    return bytes;
}

uint32_t readBigEndian(std::string_view bytes) {
    uint32_t value = 0;
    for (size_t i = 0; i < 4; ++i) value = value << 8 | static_cast<uint8_t>(bytes[i]);
    return value;
}

uint32_t getCheckSum(std::string_view bytes) {
    return static_cast<uint32_t>(
        crc32(0, reinterpret_cast<const Bytef*>(bytes.data()), static_cast<uInt>(bytes.size())));
}

std::string makeChunk(std::string_view type, std::string_view data) {
    const std::string body = std::string(type) + std::string(data);
    return bigEndian(static_cast<uint32_t>(data.size())) + body + bigEndian(getCheckSum(body));
}

// Calls visit(type, data) for each chunk up to the one of the end. Throws CError if one is damaged or cut
// off.
template <class Visit> void forEachChunk(std::string_view bytes, const Visit& visit) {
    for (size_t at = kJngSignature.size(); at + 12 <= bytes.size();) {
        const size_t length = readBigEndian(bytes.substr(at, 4));
        if (length > bytes.size() - at - 12) fail();
        const std::string_view body = bytes.substr(at + 4, length + 4);
        if (readBigEndian(bytes.substr(at + 8 + length, 4)) != getCheckSum(body)) fail();
        if (body.substr(0, 4) == "IEND") return;
        visit(body.substr(0, 4), body.substr(4));
        at += 12 + length;
    }
    fail();
}

// The data of all chunks of a type, joined.
std::string join(std::string_view bytes, std::string_view wanted) {
    std::string joined;
    forEachChunk(bytes, [&](std::string_view type, std::string_view data) {
        if (type == wanted) joined += data;
    });
    return joined;
}

} // namespace

std::string encodeJng(const wxImage& image) {
    const auto width = static_cast<uint32_t>(image.GetWidth()),
               height = static_cast<uint32_t>(image.GetHeight());
    const size_t count = static_cast<size_t>(width) * height;
    wxImage colour = image.Copy();
    colour.ClearAlpha();
    wxImage alpha(image.GetWidth(), image.GetHeight(), false);
    for (size_t i = 0; i < count; ++i)
        std::memset(alpha.GetData() + i * 3, image.HasAlpha() ? image.GetAlpha()[i] : 255, 3);
    alpha.SetOption(wxIMAGE_OPTION_PNG_FORMAT, wxPNG_TYPE_GREY_RED);
    alpha.SetOption(wxIMAGE_OPTION_PNG_BITDEPTH, 8);

    std::string header = bigEndian(width) + bigEndian(height);
    for (const uint8_t value : {kColourAlpha, uint8_t{8}, uint8_t{8}, uint8_t{0}, uint8_t{8}, kAlphaByDeflate,
                                uint8_t{0}, uint8_t{0}})
        header += static_cast<char>(value);
    // A PNG file of the alpha has the compressed samples that JNG stores.
    return std::string(kJngSignature) + makeChunk("JHDR", header) +
           makeChunk("IDAT", join(writeImage(EBitmapFormat::png, alpha), "IDAT")) +
           makeChunk("JDAT", writeImage(EBitmapFormat::jpg, colour)) + makeChunk("IEND", {});
}

wxImage decodeJng(const std::string& bytes) {
    if (!bytes.starts_with(kJngSignature)) fail();
    const std::string header = join(bytes, "JHDR");
    if (header.size() != 16) fail();
    const auto field = [&](size_t index) { return static_cast<uint8_t>(header[index]); };
    const uint8_t sampleDepth = field(9), alphaDepth = field(12), alphaCompression = field(13);
    if (sampleDepth != 8 && sampleDepth != 20) fail(); // 20: an 8-bit picture with an alternative of 12 bits
    // A JSEP chunk separates the alternatives, of which the first one has 8 bits.
    std::string colourBytes, alphaBytes;
    bool isFirst = true;
    forEachChunk(bytes, [&](std::string_view type, std::string_view data) {
        if (type == "JSEP") isFirst = false;
        if (type == "JDAT" && isFirst) colourBytes += data;
        if (type == "JDAA" || type == "IDAT") alphaBytes += data;
    });
    const SPixelSize size = probeImage(EBitmapFormat::jng, bytes);
    if (probeImage(EBitmapFormat::jpg, colourBytes) != size) fail();
    wxImage image = readImage(EBitmapFormat::jpg, colourBytes);
    if (alphaDepth == 0) return image;

    if (alphaCompression == kAlphaByDeflate) {
        // A grey PNG file around the samples.
        std::string pngHeader = header.substr(0, 8) + static_cast<char>(alphaDepth) + std::string(4, '\0');
        alphaBytes = std::string(kPngSignature) + makeChunk("IHDR", pngHeader) +
                     makeChunk("IDAT", alphaBytes) + makeChunk("IEND", {});
    } else if (alphaCompression != kAlphaByJpeg || probeImage(EBitmapFormat::jpg, alphaBytes) != size) {
        fail();
    }
    const wxImage alpha =
        readImage(alphaCompression == kAlphaByDeflate ? EBitmapFormat::png : EBitmapFormat::jpg, alphaBytes);
    if (alpha.GetWidth() != size.width || alpha.GetHeight() != size.height) fail();
    image.SetAlpha();
    const size_t count = static_cast<size_t>(size.width) * static_cast<size_t>(size.height);
    for (size_t i = 0; i < count; ++i) image.GetAlpha()[i] = alpha.GetData()[i * 3];
    return image;
}

} // namespace graphics
