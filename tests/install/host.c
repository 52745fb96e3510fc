#include <stdio.h>
#include <tonewright/tonewright.h>

/* Widens an ASCII path, which serves as a URI reference relative to the current folder. */
static const char16_t* uri(const char* path, char16_t* text) {
    size_t i = 0;
    for (; path[i]; ++i) text[i] = (char16_t)path[i];
    text[i] = 0;
    return text;
}

int main(int argc, char** argv) {
    char16_t in[256], out[256];
    if (argc != 3 || TONEWRIGHT_InitStartup() != 0) return 1;
    TONEWRIGHT_Handle source = TONEWRIGHT_CreateAudioSourceFromURI(uri(argv[1], in), 44100, 2, 2, 0);
    TONEWRIGHT_Handle format = TONEWRIGHT_CreateAudioFormatFromURI(uri(argv[2], out), 44100, 2, 2, 0.0, 0, 0, 0);
    TONEWRIGHT_Handle encoder = TONEWRIGHT_CreateAudioEncoder(source, format);
    int32_t result = encoder ? TONEWRIGHT_AudioEncoder_Encode(encoder) : 1;
    printf("%s -> %s: %d\n", argv[1], argv[2], (int)result);
    TONEWRIGHT_Handle handles[] = {encoder, format, source};
    for (int i = 0; i < 3; ++i) TONEWRIGHT_DestroyHandle(handles[i]);
    TONEWRIGHT_DeInitAll();
    return result;
}
