#include "graphics/animation/GifHandler.h"

#include "graphics/animation/GifAnimation.h"
#include "peru/gui/ImageConversion.h"
#include "wxjng/HandlerTools.h"

namespace graphics::animation {

CGifHandler::CGifHandler() {
    m_name = "GIF file";
    m_extension = "gif";
    m_type = wxBITMAP_TYPE_GIF;
    m_mime = "image/gif";
}

bool CGifHandler::LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int index) {
    return wxjng::attempt(isVerbose, [&] {
        const auto animation = peru::make<CGifAnimation>(wxjng::readAll(stream));
        *image = peru::gui::toWxImage(animation->GetFrame(std::max(index, 0)));
        return true;
    });
}

bool CGifHandler::DoCanRead(wxInputStream& stream) {
    return wxjng::startsWith(stream, "GIF8");
}

int CGifHandler::DoGetImageCount(wxInputStream& stream) {
    int count = 0;
    wxjng::attempt(false, [&] {
        count = peru::make<CGifAnimation>(wxjng::readAll(stream))->GetFrameCount();
        return true;
    });
    return count;
}

} // namespace graphics::animation
