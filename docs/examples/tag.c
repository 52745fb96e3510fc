/* Prints the title of a sound file and sets a new one: tag FILE TITLE, both in ASCII. */
#include <stdio.h>
#include <tonewright/tonewright.h>

/* Anything but ASCII would have to be converted, and escaped in a URI. */
static const char16_t* widen(const char* start, const char* text, char16_t* wide, size_t capacity) {
    size_t length = 0;
    for (; *start && length + 1 < capacity; ++start) wide[length++] = (char16_t)*start;
    for (; *text && length + 1 < capacity; ++text) wide[length++] = (char16_t)*text;
    wide[length] = 0;
    return wide;
}

static int setTitle(const char* path, const char* title) {
    char16_t wide[1024];
    TONEWRIGHT_Handle tag = TONEWRIGHT_CreateFileTag(widen("file://", path, wide, 1024));
    if (!tag) return 1; /* the reason is in the log */

    TONEWRIGHT_Handle old = TONEWRIGHT_FileTag_GetTitle(tag);
    const char16_t* text = TONEWRIGHT_GetText(old);
    for (size_t i = 0; i < TONEWRIGHT_GetTextLength(old); ++i) putchar(text[i] < 0x80 ? (int)text[i] : '?');
    putchar('\n');
    TONEWRIGHT_DestroyHandle(old);

    TONEWRIGHT_FileTag_SetTitle(tag, widen("", title, wide, 1024));
    TONEWRIGHT_FileTag_SetComment(tag, u""); /* removes it */
    int32_t status = TONEWRIGHT_StoreFileTag(tag);
    TONEWRIGHT_DestroyHandle(tag);
    return status;
}

int main(int argc, char** argv) {
    if (argc != 3 || TONEWRIGHT_InitStartup() != TONEWRIGHT_OK) return 2;
    int status = setTitle(argv[1], argv[2]);
    TONEWRIGHT_DeInitAll();
    return status;
}
