#include "graphics/documents/XData.h"

#include "graphics/geometry/Numbers.h"
#include "peru/Errors.h"

#include <limits>

namespace graphics {

std::string CRectXData::Save() const {
    std::string text;
    for (const double number : {value.left, value.top, value.width, value.height})
        text += (text.empty() ? "" : ",") + formatNumber(number);
    return text;
}

void CRectXData::Load(const std::string& text) {
    double numbers[4] = {};
    size_t begin = 0;
    for (int i = 0; i < 4; ++i) {
        const size_t end = i < 3 ? text.find(',', begin) : text.size();
        const auto number = end == std::string::npos
                                ? std::nullopt
                                : parseNumber(std::string_view(text).substr(begin, end - begin));
        if (!number) throw peru::CParseError(peru::CString::fromUTF8("Invalid rectangle: " + text));
        numbers[i] = *number;
        begin = end + 1;
    }
    value = {numbers[0], numbers[1], numbers[2], numbers[3]};
}

void CIntXData::Load(const std::string& text) {
    const auto number = parseInteger(text);
    if (!number || *number < std::numeric_limits<int32_t>::min() ||
        *number > std::numeric_limits<int32_t>::max())
        throw peru::CParseError(peru::CString::fromUTF8("Invalid integer: " + text));
    value = static_cast<int32_t>(*number);
}

P<CXData> CXDatas::Create(const std::string& typeName) {
    if (typeName == "string") return peru::make<CStringXData>();
    if (typeName == "rect") return peru::make<CRectXData>();
    if (typeName == "int") return peru::make<CIntXData>();
    return {};
}

P<CXData> CXDatas::Get(const std::string& name) const {
    const auto found = m_datas.find(name);
    return found == m_datas.end() ? P<CXData>() : found->second;
}

void CXDatas::Set(const std::string& name, const P<CXData>& data) {
    if (data)
        m_datas[name] = data;
    else
        m_datas.erase(name);
}

P<CXDatas> CXDatas::Clone() const {
    auto copy = peru::make<CXDatas>();
    for (const auto& [name, data] : m_datas) copy->m_datas[name] = data->Clone();
    return copy;
}

} // namespace graphics
