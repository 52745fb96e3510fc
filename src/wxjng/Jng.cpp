#include "wxjng/Jng.h"

#include "peru/Errors.h"
#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"
#include "wxjng/Jpeg.h"
#include "wxjng/MngLibrary.h"
#include "wxjng/PngSamples.h"

#include <cstring>
#include <wx/image.h>

namespace wxjng {

namespace {

constexpr int kJpegAlphaQuality = 95;
constexpr uint8_t kGrey = 8, kColour = 10, kAlpha = 4; // the types of pictures; kAlpha is added
constexpr uint8_t kBaseline = 0, kJpeg = 8;

bool isGrey(const wxImage& image) {
    const uint8_t* const data = image.GetData();
    const size_t bytes = 3 * static_cast<size_t>(image.GetWidth()) * static_cast<size_t>(image.GetHeight());
    for (size_t i = 0; i < bytes; i += 3)
        if (data[i] != data[i + 1] || data[i] != data[i + 2]) return false;
    return true;
}

std::string encodeColours(const wxImage& image, bool isGreyPicture, int quality) {
    const size_t count = static_cast<size_t>(image.GetWidth()) * static_cast<size_t>(image.GetHeight());
    const uint8_t* const data = image.GetData();
    SSamples picture{image.GetWidth(), image.GetHeight(), isGreyPicture ? 1 : 3, {}};
    if (!isGreyPicture) {
        picture.samples.assign(data, data + 3 * count);
    } else {
        picture.samples.resize(count);
        for (size_t i = 0; i < count; ++i) picture.samples[i] = data[3 * i];
    }
    return encodeJpeg(picture, quality);
}

mng_ptr toPointer(const std::string& bytes) {
    return const_cast<char*>(bytes.data());
}

} // namespace

std::string encodeJng(const wxImage& image, EAlphaCompression compression, int quality) {
    const bool isGreyPicture = isGrey(image);
    const std::string colours = encodeColours(image, isGreyPicture, quality);
    SSamples alpha{image.GetWidth(), image.GetHeight(), 1, {}};
    if (image.HasAlpha())
        alpha.samples.assign(image.GetAlpha(), image.GetAlpha() + static_cast<size_t>(alpha.width) *
                                                                      static_cast<size_t>(alpha.height));
    const bool isDeflated = compression == EAlphaCompression::deflate;
    std::string alphaBytes;
    if (image.HasAlpha())
        alphaBytes = isDeflated ? encodeGreyIdat(alpha) : encodeJpeg(alpha, kJpegAlphaQuality);

    CMngWriter writer;
    const mng_handle handle = writer.getHandle();
    const auto type =
        static_cast<mng_uint8>((isGreyPicture ? kGrey : kColour) + (image.HasAlpha() ? kAlpha : 0));
    writer.put(mng_putchunk_jhdr(handle, static_cast<mng_uint32>(image.GetWidth()),
                                 static_cast<mng_uint32>(image.GetHeight()), type, 8, kJpeg, kBaseline,
                                 image.HasAlpha() ? 8 : 0,
                                 image.HasAlpha() && !isDeflated ? kJpeg : mng_uint8{0}, 0, 0));
    if (image.HasAlpha()) {
        const auto put = isDeflated ? mng_putchunk_idat : mng_putchunk_jdaa;
        writer.put(put(handle, static_cast<mng_uint32>(alphaBytes.size()), toPointer(alphaBytes)));
    }
    writer.put(mng_putchunk_jdat(handle, static_cast<mng_uint32>(colours.size()), toPointer(colours)));
    writer.put(mng_putchunk_iend(handle));
    return writer.write();
}

// The chunks are read without the library: its display drops the colours of transparent pixels, and its plain
// reading decodes them a second time.
wxImage decodeJng(std::string_view bytes) {
    const auto chunks = readChunks(bytes, kJngSignature, "IEND", "jng");
    const std::string_view header = chunks.front().data;
    if (chunks.front().type != "JHDR" || header.size() != 16) failDamaged("jng");
    const auto field = [&](size_t index) { return static_cast<uint8_t>(header[index]); };
    const uint8_t type = field(8), sampleDepth = field(9), alphaDepth = field(12),
                  alphaCompression = field(13);
    const bool hasAlpha = type == kGrey + kAlpha || type == kColour + kAlpha;
    if (type != kGrey && type != kColour && !hasAlpha) failDamaged("jng");
    if (sampleDepth != 8 && sampleDepth != 20)
        failDamaged("jng"); // 20: 8 bits with an alternative of 12 bits
    peru::gui::checkImageSize(readBigEndian(header, 0), readBigEndian(header, 4));
    const auto width = static_cast<int>(readBigEndian(header, 0)),
               height = static_cast<int>(readBigEndian(header, 4));
    // A JSEP chunk separates the alternatives, of which the first one has 8 bits.
    std::string colours;
    for (const SChunk& chunk : chunks) {
        if (chunk.type == "JSEP") break;
        if (chunk.type == "JDAT") colours += chunk.data;
    }
    wxImage image(width, height, false);
    if (!image.IsOk()) throw peru::CError("Out of memory");
    const SSamples picture = decodeJpeg(colours, width, height, 3);
    std::memcpy(image.GetData(), picture.samples.data(), picture.samples.size());
    if (!hasAlpha) return image;

    const SSamples alpha = alphaCompression == kJpeg
                               ? decodeJpeg(join(chunks, "JDAA"), width, height, 1)
                               : decodeGreyIdat(join(chunks, "IDAT"), width, height, alphaDepth);
    image.SetAlpha();
    std::memcpy(image.GetAlpha(), alpha.samples.data(), alpha.samples.size());
    return image;
}

} // namespace wxjng
