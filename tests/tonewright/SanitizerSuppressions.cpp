// What the thread sanitizer is to pass over.
#ifdef TONEWRIGHT_SANITIZED

#include "peru/Api.h"

// The sound server's client library is not instrumented: its own locks are not seen.
extern "C" PERU_API const char* __tsan_default_suppressions() {
    return "race:libpulse\nrace:libasound\n";
}

#endif
