// A library that never finishes loading, and so keeps the loader's lock.
#include <cstdlib>
#include <unistd.h>

static const int g_never = [] {
    ::setenv("ENDLESS_LOADING", "1", 1);
    for (;;) ::pause();
    return 0;
}();
