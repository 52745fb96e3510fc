// The messages of the parser of arguments.
#pragma once

#include <string>

namespace host {

// The message in the user's language. One that is not known, or comes from a command, stays as it is.
std::string translateParserMessage(const std::string& message);

} // namespace host
