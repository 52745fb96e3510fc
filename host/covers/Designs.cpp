#include "Designs.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "graphics/geometry/Units.h"

#include <stdexcept>

namespace host::covers {

namespace {

std::string toName(const std::string& target) {
    if (target.size() == 1 && target[0] >= '1' && target[0] < '1' + ced::kTargetTypeCount)
        return ced::TargetTypeToXml(static_cast<ced::TargetType>(target[0] - '1'));
    return target;
}

std::string listDesigns(const ced::CProject& project) {
    std::string list;
    for (const auto& [name, document] : project.GetDocuments())
        for (size_t i = 1; i <= document->GetItems().size(); ++i)
            list += (list.empty() ? "" : ", ") + name + " " + std::to_string(i);
    return list;
}

} // namespace

SDesign findDesign(const ced::CProject& project, const std::string& target, int item) {
    const std::string wanted = toName(target);
    for (const auto& [name, document] : project.GetDocuments()) {
        if (!wanted.empty() && name != wanted) continue;
        const auto& items = document->GetItems();
        if (static_cast<size_t>(item) <= items.size())
            return {name, item, items[static_cast<size_t>(item) - 1]->GetDocument()};
    }
    const std::string list = listDesigns(project);
    if (list.empty()) throw std::runtime_error(tr("host.Covers.noDesigns", "Has no designs"));
    const std::string searched = (wanted.empty() ? "" : wanted + " ") + std::to_string(item);
    throw std::runtime_error(tr("host.Covers.noDesign", "Has no design %NAME%, only %LIST%",
                                {{"%NAME%", toPrintable(searched)}, {"%LIST%", toPrintable(list)}}));
}

std::string formatBox(const graphics::SRect& box) {
    const auto format = [](double length) {
        return peru::CString::toStdString(graphics::formatLength(length, graphics::EUnit::millimetre, 1));
    };
    return tr("host.Covers.box", "%WIDTH% x %HEIGHT% mm",
              {{"%WIDTH%", format(box.width)}, {"%HEIGHT%", format(box.height)}});
}

} // namespace host::covers
