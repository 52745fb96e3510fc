// Log entries as one text, in which they cross the pipe.
#pragma once

#include "sonora2/context/ILogManager.h"

#include <string>

namespace sonora2::common {

// Entries are separated by a control character and begin with their severity.
SONORA2_API std::string encodeLogEntry(int32_t severity, const P<peru::IString>& text);
SONORA2_API std::string encodeLogException(const peru::CException& exception);
// Passes the entries of a text on to a log. A text without severities is one entry at the level of
// information.
SONORA2_API void replayLog(const P<peru::IString>& entries, ILogManager& log);

} // namespace sonora2::common
