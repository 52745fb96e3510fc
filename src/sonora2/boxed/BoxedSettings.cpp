#include "sonora2/boxed/BoxedSettings.h"

#include <algorithm>
#include <charconv>
#include <string>
#include <string_view>

namespace sonora2::common {

namespace {

uint32_t getNumber(const P<ISonoraContext>& context, const char* name, uint32_t otherwise) {
    const std::string text = peru::CString::toStdString(context->getParameter(kBoxedParameterKey, name));
    uint32_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc() && end == text.data() + text.size() ? number : otherwise;
}

} // namespace

uint32_t getBoxedDeadline(const P<ISonoraContext>& context) {
    return getNumber(context, kBoxedDeadlineParameter, kBoxedDeadline);
}

uint32_t getBoxedMemory(const P<ISonoraContext>& context) {
    return getNumber(context, kBoxedMemoryParameter, kBoxedMemory);
}

bool isBoxedPlugin(const P<ISonoraContext>& context, const peru::CStringArg& name) {
    const std::string list =
        peru::CString::toStdString(context->getParameter(kBoxedParameterKey, kBoxedPluginsParameter));
    const std::string wanted = peru::CString::toStdString(name);
    const auto isNamed = [&](std::string_view each) {
        constexpr std::string_view kPrefix = "sonora2_";
        return each == wanted || (wanted.starts_with(kPrefix) && wanted.substr(kPrefix.size()) == each);
    };
    std::string_view rest = list;
    while (!rest.empty()) {
        const std::string_view each = rest.substr(0, rest.find(','));
        if (each == "all" || isNamed(each)) return true;
        rest.remove_prefix(std::min(rest.size(), each.size() + 1));
    }
    return false;
}

} // namespace sonora2::common
