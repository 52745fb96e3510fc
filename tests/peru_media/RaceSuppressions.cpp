// What the thread sanitizer is to pass over.
#ifdef TONEWRIGHT_SANITIZED

#include "peru/Api.h"

// The sound server's client hands blocks between its threads over lists without locks, and is not built for
// the sanitizer, which sees the blocks and not the lists.
extern "C" PERU_API const char* __tsan_default_suppressions() {
    return "race:libpulse";
}

#endif
