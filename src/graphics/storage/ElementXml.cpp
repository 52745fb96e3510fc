// The XML of elements, by class.
#include "graphics/documents/FreeForm.h"
#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/storage/IResourceStores.h"
#include "graphics/storage/XmlNames.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"

namespace graphics {

void CGraphicElement::Save(const Node& node, IResourceOutputStore&) const {
    writeAttribute(node, "name", GetName());
    write(node, "center", GetCenter());
    write(node, "size", GetSize());
    writeBool(node, "coloured", m_isColoured);
    if (IsMirrored(EAxis::x)) writeBool(node, "mirror-x", true);
    if (IsMirrored(EAxis::y)) writeBool(node, "mirror-y", true);
    writeNumber(node, "rotation", GetRotation());
    writeBool(node, "visible", IsVisible());
    if (m_isModified) writeBool(node, "modified", true);
    writeAttribute(node, "content-id", m_contentId);
    if (m_contentIndex > 0) writeInteger(node, "content-index", m_contentIndex);
    writeAttribute(node, "text-id", m_textId);
    if (!m_tags.empty()) {
        const Node tags = addChild(node, "tags");
        for (const std::string& tag : m_tags) tags->addChildNode(peru::CString::fromUTF8(encodeName(tag)));
    }
    if (!m_groups.empty()) {
        const Node groups = addChild(node, "groups");
        for (const int32_t group : m_groups) writeInteger(addChild(groups, "group"), "number", group);
    }
}

void CGraphicElement::Load(const Node& node, IResourceInputStore&) {
    if (std::string name; readAttribute(node, "name", name)) SetName(name);
    if (SPoint center = GetCenter(); read(node, "center", center)) SetCenter(center.x, center.y);
    if (SSize size = GetSize(); read(node, "size", size)) SetSize(size.width, size.height);
    if (bool isColoured; readBool(node, "coloured", isColoured)) SetColoured(isColoured);
    if (bool isMirrored; readBool(node, "mirror-x", isMirrored)) SetMirrored(EAxis::x, isMirrored);
    if (bool isMirrored; readBool(node, "mirror-y", isMirrored)) SetMirrored(EAxis::y, isMirrored);
    if (double rotation; readNumber(node, "rotation", rotation)) SetRotation(rotation);
    if (bool isVisible; readBool(node, "visible", isVisible)) SetVisible(isVisible);
    readBool(node, "modified", m_isModified);
    readAttribute(node, "content-id", m_contentId);
    readInteger(node, "content-index", m_contentIndex);
    readAttribute(node, "text-id", m_textId);
    ClearTags();
    if (const Node tags = node->getChildNode("tags"))
        for (auto children = tags->getChildNodes(); children.hasMore();)
            AddTag(decodeName(graphics::getName(children.getNext())));
    ClearGroups();
    if (const Node groups = node->getChildNode("groups"))
        for (auto children = groups->getChildNodesByName("group"); children.hasMore();) {
            int32_t group = 0;
            readInteger(children.getNext(), "number", group);
            AddGroup(group);
        }
}

void CGraphicFilled::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    write(node, "brush", m_brush);
    write(node, "pen", m_pen);
}

void CGraphicFilled::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    read(node, "brush", m_brush);
    read(node, "pen", m_pen);
}

void CGraphicShape::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    write(node, "gradient", m_gradient);
    writeAttribute(node, "shape", ShapeTypeToXml(m_type));
    write(node, "brush", GetBrush());
    write(node, "pen", GetPen());
    writeNumber(node, "corner-radius", m_cornerRadius);
    if (m_freeForm) m_freeForm->Save(addChild(node, "free-form"), store);
}

void CGraphicShape::Load(const Node& node, IResourceInputStore& store) {
    CGraphicFilled::Load(node, store);
    read(node, "gradient", m_gradient);
    if (std::string type; readAttribute(node, "shape", type)) m_type = ShapeTypeFromXml(type);
    readNumber(node, "corner-radius", m_cornerRadius);
    if (const Node freeForm = node->getChildNode("free-form")) m_freeForm = CFreeForm::Load(freeForm, store);
}

void CGraphicLine::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    write(node, "start", m_start);
    write(node, "end", m_end);
    if (m_pen != SPen()) write(node, "pen", m_pen);
}

void CGraphicLine::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    const bool hasStart = read(node, "start", m_start), hasEnd = read(node, "end", m_end);
    // The points define the box. One that is stored is taken as it is, so that saving it again changes
    // nothing.
    if ((hasStart || hasEnd) && (!node->getChildNode("center") || !node->getChildNode("size")))
        SetLine(m_start, m_end);
    read(node, "pen", m_pen);
}

void CGraphicStateButton::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    writeAttribute(node, "label", m_label);
    writeAttribute(node, "hint", m_buttonHint);
}

void CGraphicStateButton::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    readAttribute(node, "label", m_label);
    readAttribute(node, "hint", m_buttonHint);
}

void CGraphicLabel::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    writeAttribute(node, "text", m_text);
    write(node, "font", m_font);
    write(node, "color", m_colour);
}

void CGraphicLabel::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    readAttribute(node, "text", m_text);
    read(node, "font", m_font);
    read(node, "color", m_colour);
}

void CGraphicImage::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    write(node, "scale-margins", m_scaleMargins);
    if (m_isNoScale) writeBool(node, "noscale", true);
    writeAttribute(node, "filename", m_fileName);
    store.SaveBitmap(node, "attachment-bitmap", m_bitmap.Get(), m_fileName);
}

void CGraphicImage::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    read(node, "scale-margins", m_scaleMargins);
    readBool(node, "noscale", m_isNoScale);
    readAttribute(node, "filename", m_fileName);
    std::string source;
    SetBitmap(store.LoadBitmap(node, "attachment-bitmap", source));
}

void CGraphicText::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    if (m_placement != EVerticalPlacement::top)
        writeInteger(node, "vertical-placement", static_cast<int>(m_placement));
    store.SaveRichText(node, "attachment-richtextbuffer", m_text);
}

void CGraphicText::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    if (int32_t placement = 0; readInteger(node, "vertical-placement", placement)) {
        if (placement < 0 || placement > 2)
            throwInvalid(node, "vertical-placement", std::to_string(placement));
        m_placement = static_cast<EVerticalPlacement>(placement);
    }
    SetText(store.LoadRichText(node, "attachment-richtextbuffer"));
}

void CGraphicTextCircle::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicText::Save(node, store);
    writeAttribute(node, "circle-type", CircleTypeToXml(m_circleType));
}

void CGraphicTextCircle::Load(const Node& node, IResourceInputStore& store) {
    CGraphicText::Load(node, store);
    if (std::string type; readAttribute(node, "circle-type", type)) m_circleType = CircleTypeFromXml(type);
}

void CGraphicMirror::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    if (m_document) m_document->Save(addChild(node, "graphic-document"), store);
}

void CGraphicMirror::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    SetDocument(nullptr);
    if (const Node inner = node->getChildNode("graphic-document")) {
        const auto document = peru::make<CGraphicDocument>();
        document->Load(inner, store);
        SetDocument(document);
    }
}

} // namespace graphics
