#include "wxjng/Handlers.h"

#include "peru/Errors.h"
#include "peru/gui/ImageConversion.h"
#include "wxjng/Chunks.h"
#include "wxjng/HandlerTools.h"
#include "wxjng/Jng.h"
#include "wxjng/Mng.h"

namespace wxjng {

namespace {

constexpr int kDefaultQuality = 92;

} // namespace

CJngHandler::CJngHandler() {
    m_name = "JNG file";
    m_extension = "jng";
    m_type = static_cast<wxBitmapType>(kJngType);
    m_mime = "image/x-jng";
}

bool CJngHandler::LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int) {
    return attempt(isVerbose, [&] {
        *image = decodeJng(readAll(stream));
        return true;
    });
}

bool CJngHandler::SaveFile(wxImage* image, wxOutputStream& stream, bool isVerbose) {
    return attempt(isVerbose, [&] {
        wxImage copy = *image;
        if (copy.HasMask() && !copy.HasAlpha()) copy.InitAlpha();
        const int quality = copy.HasOption(wxIMAGE_OPTION_QUALITY) ? copy.GetOptionInt(wxIMAGE_OPTION_QUALITY)
                                                                   : kDefaultQuality;
        const bool isJpeg =
            copy.GetOptionInt(kOptionAlphaCompression) == static_cast<int>(EAlphaCompression::jpeg);
        const std::string bytes =
            encodeJng(copy, isJpeg ? EAlphaCompression::jpeg : EAlphaCompression::deflate, quality);
        return stream.WriteAll(bytes.data(), bytes.size());
    });
}

bool CJngHandler::DoCanRead(wxInputStream& stream) {
    return startsWith(stream, kJngSignature);
}

CMngHandler::CMngHandler() {
    m_name = "MNG file";
    m_extension = "mng";
    m_type = static_cast<wxBitmapType>(kMngType);
    m_mime = "video/x-mng";
}

bool CMngHandler::LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int index) {
    return attempt(isVerbose, [&] {
        CMngReader reader(readAll(stream));
        for (int i = 0; i <= std::max(index, 0); ++i)
            if (!reader.next()) failDamaged("mng");
        *image = peru::gui::toWxImage(reader.getImage());
        return true;
    });
}

bool CMngHandler::SaveFile(wxImage* image, wxOutputStream& stream, bool isVerbose) {
    return attempt(isVerbose, [&] {
        const std::string bytes = encodeMng({{*image, 0}}, 1);
        return stream.WriteAll(bytes.data(), bytes.size());
    });
}

bool CMngHandler::DoCanRead(wxInputStream& stream) {
    return startsWith(stream, kMngSignature);
}

int CMngHandler::DoGetImageCount(wxInputStream& stream) {
    int count = 0;
    attempt(false, [&] {
        CMngReader reader(readAll(stream));
        while (reader.next()) ++count;
        return true;
    });
    return count;
}

} // namespace wxjng
