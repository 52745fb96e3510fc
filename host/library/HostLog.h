// Prints the library's log.
#pragma once

#include "library/Library.h"

#include <cstdint>

namespace host {

class CHostLog {
public:
    // Prints the library's log messages of `printLevel` (a TONEWRIGHT_LogLevel) and above to standard error
    // until the object is destroyed.
    CHostLog(CLibrary& library, int32_t printLevel);
    ~CHostLog();
    CHostLog(const CHostLog&) = delete;
    CHostLog& operator=(const CHostLog&) = delete;

private:
    CLibrary& m_library;
    CHandle m_log;
};

} // namespace host
