/* A host in C: what the public header promises, without any C++. */
#include "tonewright/tonewright.h"

/* The first extension that can be read, copied to `text`; its length, or a negative step number. */
int tests_readFirstExtension(char16_t* text, size_t capacity) {
    TONEWRIGHT_Handle extensions = TONEWRIGHT_getValidCodecExtensions(TONEWRIGHT_AUDIO_SOURCE);
    if (!extensions) return -1;
    if (TONEWRIGHT_getExtensionCount(extensions) < 1) return -2;
    TONEWRIGHT_Handle extension = TONEWRIGHT_getExtension(extensions, 0);
    TONEWRIGHT_DestroyHandle(extensions);
    if (!extension) return -3;
    const size_t length = TONEWRIGHT_GetTextLength(extension);
    const char16_t* source = TONEWRIGHT_GetText(extension);
    if (length + 1 > capacity) return -4;
    for (size_t i = 0; i <= length; ++i) text[i] = source[i];
    TONEWRIGHT_DestroyHandle(extension);
    return (int)length;
}
