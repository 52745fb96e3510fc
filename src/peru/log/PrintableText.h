// Text for terminals and files.
#pragma once

#include <string>
#include <string_view>

namespace peru {

// Valid UTF-8 without control characters except tabs and line ends: a name in a message must not move the
// cursor or change the colours of a terminal. Controls and invalid bytes become "\xNN".
std::string makePrintable(std::string_view utf8);

} // namespace peru
