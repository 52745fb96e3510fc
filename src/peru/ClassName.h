// Class names from run-time type information.
#pragma once

#include "peru/Api.h"

#include <string>
#include <typeinfo>

namespace peru {

// The name as written in the source, such as "peru::CArray".
PERU_API std::string getClassName(const std::type_info& type);

} // namespace peru
