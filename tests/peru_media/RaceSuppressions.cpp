// Suppressions for the thread sanitizer.
#ifdef TONEWRIGHT_SANITIZED

#include "peru/Api.h"

// The sound server's client library passes blocks between threads in lock-free lists and is not instrumented,
// so the sanitizer sees the blocks but not the synchronisation.
extern "C" PERU_API const char* __tsan_default_suppressions() {
    return "race:libpulse";
}

#endif
