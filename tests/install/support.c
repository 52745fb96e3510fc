/* A host of both libraries: what its target can hold, by the installed plug-ins. */
#include <stdio.h>
#include <tonewright/host.h>

int main(void) {
    if (TONEWRIGHT_InitStartup() != 0) return 1;
    char16_t* uri = TONEWRIGHT_Host_PathToURI("/tmp/x.mp3");
    const int32_t low = TONEWRIGHT_Host_CanWrite(uri, 48000, 2, 2),
                  high = TONEWRIGHT_Host_CanWrite(uri, 96000, 2, 2);
    TONEWRIGHT_Host_Free(uri);
    TONEWRIGHT_DeInitAll();
    printf("48 kHz: %d, 96 kHz: %d\n", (int)low, (int)high);
    return low == 1 && high == 0 ? 0 : 1;
}
