// Prints the library's log.
#pragma once

#include "Library.h"

#include <cstdint>

namespace host {

class CHostLog {
public:
    // Prints to standard error what the library logs at `printLevel` (a TONEWRIGHT_LogLevel) or above, for as
    // long as it lives.
    CHostLog(CLibrary& library, int32_t printLevel);
    ~CHostLog();
    CHostLog(const CHostLog&) = delete;
    CHostLog& operator=(const CHostLog&) = delete;

private:
    CLibrary& m_library;
    CHandle m_log;
};

} // namespace host
