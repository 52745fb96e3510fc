// Leaks of libraries that the address sanitizer should ignore.
#ifdef TONEWRIGHT_SANITIZED

// The Vorbis encoder leaks a block of its six-channel tables for each file.
extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions() {
    return "leak:vorbis_encode_setup_init";
}

#endif
