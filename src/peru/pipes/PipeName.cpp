#include "peru/pipes/PipeName.h"

#include "peru/strings/StringFormat.h"

namespace peru {

bool isPipeName(const CStringArg& name) {
    const std::string bytes = CString::toStdString(name);
    if (bytes.empty() || bytes.size() > static_cast<size_t>(kLongestPipeName) || bytes[0] == '.')
        return false;
    return std::none_of(bytes.begin(), bytes.end(), [](char ch) {
        const auto byte = static_cast<unsigned char>(ch);
        return byte < 0x20 || byte == 0x7F || ch == '/' || ch == '\\';
    });
}

P<IString> getFullPipeName(const CStringArg& name) {
    return make<CStringFormat>("\\\\.\\pipe\\%s")->push(name).getText();
}

} // namespace peru
