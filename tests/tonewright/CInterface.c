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

static bool countCalls(double fraction, int32_t reserved) {
    return fraction <= 1.0 && reserved == 0;
}

/* A whole conversion; 0, or the number of the step that failed. */
int tests_convert(const char16_t* from, const char16_t* to) {
    int step = 1;
    TONEWRIGHT_Handle format = NULL, encoder = NULL;
    TONEWRIGHT_Handle source = TONEWRIGHT_CreateAudioSourceFromURI(from, 8000, 1, 2, 0);
    if (!source) goto end;
    step = 2;
    format = TONEWRIGHT_CreateAudioFormatFromURI(to, 8000, 1, 2, 0.5, 0, 0, 0);
    if (!format) goto end;
    step = 3;
    encoder = TONEWRIGHT_CreateAudioEncoder(source, format);
    if (!encoder) goto end;
    step = 4;
    if (TONEWRIGHT_AudioEncoder_SetCallback(encoder, countCalls) != TONEWRIGHT_OK) goto end;
    step = TONEWRIGHT_AudioEncoder_Encode(encoder) == TONEWRIGHT_OK ? 0 : 5;
end:
    TONEWRIGHT_DestroyHandle(encoder);
    TONEWRIGHT_DestroyHandle(format);
    TONEWRIGHT_DestroyHandle(source);
    return step;
}
