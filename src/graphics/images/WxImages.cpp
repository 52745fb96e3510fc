#include "graphics/images/WxImages.h"

#include "graphics/animation/GifHandler.h"
#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "wxjng/Handlers.h"

#include <wx/imagbmp.h>
#include <wx/imagjpeg.h>
#include <wx/imagpng.h>
#include <wx/imagtiff.h>
#include <wx/log.h>
#include <wx/mstream.h>

namespace graphics {

namespace {

constexpr int kJpegQuality = 92;

template <class Handler> void registerHandler(int type) {
    // The toolkit's list owns the handler.
    if (!wxImage::FindHandler(static_cast<wxBitmapType>(type))) wxImage::AddHandler(new Handler);
}

// A toolkit that was never started does not release its list.
struct SHandlers {
    ~SHandlers() { wxImage::CleanUpHandlers(); }
};

[[noreturn]] void fail(const char* key, const char* text, EBitmapFormat format) {
    throw peru::CError(
        peru::localize(key, text, {{"%FORMAT%", peru::CString::fromUTF8(getExtension(format))}}));
}

wxImageHandler* findHandler(EBitmapFormat format) {
    registerImageHandlers();
    wxImageHandler* const handler = wxImage::FindHandler(static_cast<wxBitmapType>(format));
    if (!handler) throw peru::CInvalidArgError("format", "findHandler");
    return handler;
}

} // namespace

// The toolkit may be started and stopped in between, so its list decides what is missing.
void registerImageHandlers() {
    static const SHandlers s_handlers;
    registerHandler<wxBMPHandler>(wxBITMAP_TYPE_BMP);
    registerHandler<wxICOHandler>(wxBITMAP_TYPE_ICO);
    registerHandler<wxPNGHandler>(wxBITMAP_TYPE_PNG);
    registerHandler<wxJPEGHandler>(wxBITMAP_TYPE_JPEG);
    registerHandler<wxTIFFHandler>(wxBITMAP_TYPE_TIFF);
    registerHandler<animation::CGifHandler>(wxBITMAP_TYPE_GIF);
    registerHandler<wxjng::CJngHandler>(wxjng::kJngType);
    registerHandler<wxjng::CMngHandler>(wxjng::kMngType);
}

wxImage readImage(EBitmapFormat format, const std::string& bytes) {
    const wxLogNull quiet; // the handlers report to the log, which a host may show in a window
    wxMemoryInputStream stream(bytes.data(), bytes.size());
    wxImage image;
    if (!findHandler(format)->LoadFile(&image, stream, false, -1) || !image.IsOk())
        fail("graphics.WxImages.Damaged", "The %FORMAT% picture is damaged.", format);
    return image;
}

std::string writeImage(EBitmapFormat format, const wxImage& image) {
    const wxLogNull quiet;
    wxMemoryOutputStream stream;
    wxImage copy = image; // shares the pixels; options are the copy's own
    copy.SetOption(wxIMAGE_OPTION_QUALITY, kJpegQuality);
    if (!findHandler(format)->SaveFile(&copy, stream, false))
        fail("graphics.WxImages.NotWritten", "The picture could not be written as %FORMAT%.", format);
    std::string bytes(stream.GetSize(), '\0');
    stream.CopyTo(bytes.data(), bytes.size());
    return bytes;
}

} // namespace graphics
