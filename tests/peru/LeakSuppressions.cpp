// Suppressions for the leak check of the address sanitizer.
#ifdef TONEWRIGHT_SANITIZED

#include "peru/Api.h"

// GIO keeps its table of content types until the process exits, about a hundred bytes of it unreachable.
extern "C" PERU_API const char* __lsan_default_suppressions() {
    return "leak:libgio-2.0";
}

#endif
