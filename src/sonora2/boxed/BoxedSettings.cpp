#include "sonora2/boxed/BoxedSettings.h"

#include <charconv>
#include <string>
#include <string_view>

namespace sonora2::common {

uint32_t getBoxedDeadline(const P<ISonoraContext>& context) {
    const std::string text =
        peru::CString::toStdString(context->getParameter(kBoxedParameterKey, kBoxedDeadlineParameter));
    uint32_t milliseconds = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), milliseconds);
    return error == std::errc() && end == text.data() + text.size() ? milliseconds : kBoxedDeadline;
}

bool isBoxedPlugin(const P<ISonoraContext>& context, const peru::CStringArg& name) {
    const std::string list =
        peru::CString::toStdString(context->getParameter(kBoxedParameterKey, kBoxedPluginsParameter));
    const std::string wanted = peru::CString::toStdString(name);
    std::string_view rest = list;
    while (!rest.empty()) {
        const std::string_view each = rest.substr(0, rest.find(','));
        if (each == "all" || each == wanted) return true;
        rest.remove_prefix(std::min(rest.size(), each.size() + 1));
    }
    return false;
}

} // namespace sonora2::common
