// For programs that paint text under the leak sanitizer; to be included in one source file.
#pragma once

// The font library's configuration and patterns belong to the default font map, which is never released.
extern "C" inline __attribute__((used, visibility("default"))) const char* __lsan_default_suppressions() {
    return "leak:libfontconfig.so\n";
}
