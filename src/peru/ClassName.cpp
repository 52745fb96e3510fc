#include "peru/ClassName.h"

#include <cstdlib>
#include <cxxabi.h>
#include <memory>

namespace peru {

std::string getClassName(const std::type_info& type) {
    int status = 0;
    std::unique_ptr<char, decltype(&std::free)> name(
        abi::__cxa_demangle(type.name(), nullptr, nullptr, &status), &std::free);
    return name ? name.get() : type.name();
}

} // namespace peru
