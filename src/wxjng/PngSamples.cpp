#include "wxjng/PngSamples.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "wxjng/Chunks.h"

#include <cstring>
#include <wx/imagpng.h>
#include <wx/log.h>
#include <wx/mstream.h>

namespace wxjng {

namespace {

// Chunks of a PNG file that the toolkit writes.
std::string encodeIdat(wxImage image) {
    const wxLogNull quiet;
    wxMemoryOutputStream stream;
    if (!wxPNGHandler().SaveFile(&image, stream, false))
        throw peru::CError(peru::localize("graphics.WxImages.NotWritten",
                                          "The picture could not be written as %FORMAT%.",
                                          {{"%FORMAT%", "png"}}));
    std::string file(stream.GetSize(), '\0');
    stream.CopyTo(file.data(), file.size());
    return join(readChunks(file, kPngSignature, "IEND", "png"), "IDAT");
}

} // namespace

std::string encodeGreyIdat(const SSamples& picture) {
    wxImage image(picture.width, picture.height, false);
    if (!image.IsOk()) throw peru::CError("Out of memory");
    for (size_t i = 0; i < picture.samples.size(); ++i)
        std::memset(image.GetData() + i * 3, picture.samples[i], 3);
    image.SetOption(wxIMAGE_OPTION_PNG_FORMAT, wxPNG_TYPE_GREY_RED);
    image.SetOption(wxIMAGE_OPTION_PNG_BITDEPTH, 8);
    return encodeIdat(std::move(image));
}

SPngData encodeColourIdat(const wxImage& image) {
    wxImage copy = image; // shares the pixels; options are the copy's own
    if (copy.HasMask() && !copy.HasAlpha()) copy.InitAlpha();
    copy.SetOption(wxIMAGE_OPTION_PNG_FORMAT, wxPNG_TYPE_COLOUR);
    copy.SetOption(wxIMAGE_OPTION_PNG_BITDEPTH, 8);
    const bool hasAlpha = copy.HasAlpha();
    return {hasAlpha, encodeIdat(std::move(copy))};
}

SSamples decodeGreyIdat(const std::string& idat, int width, int height, int depth) {
    // A PNG file around the samples.
    const std::string header = makeBigEndian(static_cast<uint32_t>(width)) +
                               makeBigEndian(static_cast<uint32_t>(height)) + static_cast<char>(depth) +
                               std::string(4, '\0');
    const std::string file = std::string(kPngSignature) + makeChunk("IHDR", header) +
                             makeChunk("IDAT", idat) + makeChunk("IEND", {});
    const wxLogNull quiet;
    wxMemoryInputStream stream(file.data(), file.size());
    wxImage image;
    if (!wxPNGHandler().LoadFile(&image, stream, false) || !image.IsOk() || image.GetWidth() != width ||
        image.GetHeight() != height)
        failDamaged("png");
    SSamples picture{width, height, 1, {}};
    picture.samples.resize(static_cast<size_t>(width) * static_cast<size_t>(height));
    for (size_t i = 0; i < picture.samples.size(); ++i) picture.samples[i] = image.GetData()[3 * i];
    return picture;
}

} // namespace wxjng
