// Formatted text.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"

#include <string>

namespace graphics {

using peru::P;

// Text in the XML of rich text buffers, as files hold it. Immutable, so that clones share it; a buffer is
// made from it only for layout and editing, and documents can be loaded and saved without a user interface.
class GRAPHICS_API CRichText : public peru::CObject {
public:
    explicit CRichText(std::string xml) : m_xml(std::move(xml)) {}
    ~CRichText() override = default;

    const std::string& GetXml() const { return m_xml; }

private:
    const std::string m_xml;
};

} // namespace graphics
