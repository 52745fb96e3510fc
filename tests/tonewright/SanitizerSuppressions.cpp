// Thread sanitizer suppressions.
#ifdef TONEWRIGHT_SANITIZED

#include "peru/Api.h"

// The sound server's client library is not instrumented, so its locks are invisible.
extern "C" PERU_API const char* __tsan_default_suppressions() {
    return "race:libpulse\nrace:libasound\n";
}

#endif
