#include "graphics/documents/FreeForm.h"

#include "graphics/elements/BasicElements.h"
#include "peru/GlobalObjFactory.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

namespace {

std::string localizeName(const char* key, const char* text) {
    return peru::CString::toStdString(peru::localize(key, text));
}

} // namespace

CFreeForm::CFreeForm(std::string id) : m_id(std::move(id)), m_document(peru::make<CGraphicDocument>()) {}

CFreeForm::CFreeForm(std::string id, std::initializer_list<SPoint> vertices) : CFreeForm(std::move(id)) {
    const auto add = [this](SPoint vertex) {
        const auto point = peru::make<CGraphicPoint>();
        point->SetCenter(vertex.x, vertex.y);
        m_document->Add(point);
    };
    for (const SPoint vertex : vertices) add(vertex);
    if (vertices.size() != 0) add(*vertices.begin());
}

std::string CFreeForm::GetDisplayName() const {
    const P<CFreeForm> known = getFreeFormManager()->Find(m_id);
    return known ? known->GetDisplayName() : m_id;
}

P<CFreeForm> CFreeForm::Clone() const {
    auto copy = peru::make<CFreeForm>(m_id);
    for (const auto& point : m_document->GetElements()) copy->m_document->Add(point->Clone());
    return copy;
}

Polygon CFreeForm::GetPolygon(const SRect& rect) const {
    Polygon polygon;
    for (const auto& point : m_document->GetElements()) polygon.push_back(point->GetCenter());
    const SRect own = getBounds(polygon);
    for (SPoint& point : polygon) {
        // A polygon without extent in one direction lies in the middle of the rectangle.
        const double x = own.width > 0 ? (point.x - own.left) / own.width : 0.5;
        const double y = own.height > 0 ? (point.y - own.top) / own.height : 0.5;
        point = {rect.left + x * rect.width, rect.top + y * rect.height};
    }
    return polygon;
}

CFreeFormStar::CFreeFormStar()
    : CFreeForm("freeform.star", {{0, 117},
                                  {117, 117},
                                  {154, 0},
                                  {191, 117},
                                  {309, 117},
                                  {213, 192},
                                  {250, 312},
                                  {154, 239},
                                  {59, 312},
                                  {94, 192}}) {}

std::string CFreeFormStar::GetDisplayName() const {
    return localizeName("CFreeFormStar.Star", "Star");
}

CFreeFormTrapeze::CFreeFormTrapeze()
    : CFreeForm("freeform.trapeze", {{-0.6, -1}, {0.6, -1}, {1, 1}, {-1, 1}}) {}

std::string CFreeFormTrapeze::GetDisplayName() const {
    return localizeName("CFreeFormTrapeze.Trapeze", "Trapeze");
}

CFreeFormTriangle::CFreeFormTriangle() : CFreeForm("freeform.triangle", {{0, -1}, {1, 1}, {-1, 1}}) {}

std::string CFreeFormTriangle::GetDisplayName() const {
    return localizeName("CFreeFormTriangle.Triangle", "Triangle");
}

CFreeFormParallelogram::CFreeFormParallelogram()
    : CFreeForm("freeform.parallelogram", {{0, 0}, {0.8, 0}, {1, 1}, {0.2, 1}}) {}

std::string CFreeFormParallelogram::GetDisplayName() const {
    return localizeName("CFreeFormParallelogram.Parallelogram", "Parallelogram");
}

CFreeFormManager::CFreeFormManager()
    : m_forms{peru::make<CFreeFormStar>(), peru::make<CFreeFormTrapeze>(), peru::make<CFreeFormTriangle>(),
              peru::make<CFreeFormParallelogram>()} {}

P<CFreeForm> CFreeFormManager::Find(const std::string& id) const {
    for (const auto& form : m_forms)
        if (form->GetId() == id) return form;
    return {};
}

P<CFreeFormManager> getFreeFormManager() {
    static const peru::CGlobalObjFactory::SKey s_key;
    return peru::CGlobalObjFactory::get<CFreeFormManager>(
        s_key, +[]() -> P<CFreeFormManager> { return peru::make<CFreeFormManager>(); });
}

} // namespace graphics
