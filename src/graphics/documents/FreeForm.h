// Named polygons that shapes take their outline from.
#pragma once

#include "graphics/documents/GraphicDocument.h"

namespace graphics {

// A closed polygon; its vertices are the points of a document, the last one equal to the first.
class GRAPHICS_API CFreeForm : public peru::CObject {
public:
    explicit CFreeForm(std::string id);
    ~CFreeForm() override = default;

    // Localised, or the id of a form that this program does not know.
    virtual std::string GetDisplayName() const;
    // Name and vertices.
    virtual void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const;
    virtual P<CFreeForm> Clone() const;
    // A form of the program by its name, otherwise one with the vertices of the node.
    static P<CFreeForm> Load(const P<peru::IXmlNode>& node, IResourceInputStore& store);

    const std::string& GetId() const { return m_id; }
    const P<CGraphicDocument>& GetDocument() const { return m_document; }
    // Scaled from the polygon's own bounding box to the rectangle.
    Polygon GetPolygon(const SRect& rect) const;

protected:
    CFreeForm(std::string id, std::initializer_list<SPoint> vertices);

private:
    const std::string m_id;
    const P<CGraphicDocument> m_document;
};

class GRAPHICS_API CFreeFormStar : public CFreeForm {
public:
    CFreeFormStar();
    ~CFreeFormStar() override = default;
    std::string GetDisplayName() const override;
};

class GRAPHICS_API CFreeFormTrapeze : public CFreeForm {
public:
    CFreeFormTrapeze();
    ~CFreeFormTrapeze() override = default;
    std::string GetDisplayName() const override;
};

class GRAPHICS_API CFreeFormTriangle : public CFreeForm {
public:
    CFreeFormTriangle();
    ~CFreeFormTriangle() override = default;
    std::string GetDisplayName() const override;
};

class GRAPHICS_API CFreeFormParallelogram : public CFreeForm {
public:
    CFreeFormParallelogram();
    ~CFreeFormParallelogram() override = default;
    std::string GetDisplayName() const override;
};

// The forms that the program offers.
class GRAPHICS_API CFreeFormManager : public peru::CObject {
public:
    CFreeFormManager();
    ~CFreeFormManager() override = default;

    const std::vector<P<CFreeForm>>& GetForms() const { return m_forms; }
    // Empty if the id is unknown.
    P<CFreeForm> Find(const std::string& id) const;

private:
    std::vector<P<CFreeForm>> m_forms;
};

GRAPHICS_API P<CFreeFormManager> getFreeFormManager();

} // namespace graphics
