// What the sanitizers must not report of libraries that are not ours.

// The table of content types is loaded once and keeps a few lists that nothing points to any more: a fixed
// hundred bytes, however often it is asked.
extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions();

const char* __lsan_default_suppressions() {
    return "leak:libgio-2.0.so\n";
}
