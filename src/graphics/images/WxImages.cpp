#include "graphics/images/WxImages.h"

#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <wx/imagbmp.h>
#include <wx/imagjpeg.h>
#include <wx/imagpng.h>
#include <wx/log.h>
#include <wx/mstream.h>

namespace graphics {

namespace {

constexpr int kJpegQuality = 92;

std::unique_ptr<wxImageHandler> makeHandler(EBitmapFormat format) {
    switch (format) {
    case EBitmapFormat::bmp:
        return std::make_unique<wxBMPHandler>();
    case EBitmapFormat::ico:
        return std::make_unique<wxICOHandler>();
    case EBitmapFormat::png:
        return std::make_unique<wxPNGHandler>();
    case EBitmapFormat::jpg:
        return std::make_unique<wxJPEGHandler>();
    default:
        throw peru::CInvalidArgError("format", "makeHandler");
    }
}

[[noreturn]] void fail(const char* key, const char* text, EBitmapFormat format) {
    throw peru::CError(
        peru::localize(key, text, {{"%FORMAT%", peru::CString::fromUTF8(getExtension(format))}}));
}

} // namespace

wxImage readImage(EBitmapFormat format, const std::string& bytes) {
    const wxLogNull quiet; // the handlers report to the log, which a host may show in a window
    wxMemoryInputStream stream(bytes.data(), bytes.size());
    wxImage image;
    if (!makeHandler(format)->LoadFile(&image, stream, false) || !image.IsOk())
        fail("graphics.WxImages.Damaged", "The %FORMAT% picture is damaged.", format);
    return image;
}

std::string writeImage(EBitmapFormat format, const wxImage& image) {
    const wxLogNull quiet;
    wxMemoryOutputStream stream;
    wxImage copy = image; // shares the pixels; options are the copy's own
    copy.SetOption(wxIMAGE_OPTION_QUALITY, kJpegQuality);
    if (!makeHandler(format)->SaveFile(&copy, stream, false))
        fail("graphics.WxImages.NotWritten", "The picture could not be written as %FORMAT%.", format);
    std::string bytes(stream.GetSize(), '\0');
    stream.CopyTo(bytes.data(), bytes.size());
    return bytes;
}

} // namespace graphics
