/* Compiles the header as C11. */
#include <tonewright/host.h>

_Static_assert(sizeof(TONEWRIGHT_MediaInfo) == 168, "the record is part of the binary interface");
_Static_assert(sizeof(TONEWRIGHT_Capabilities) == 152, "the record is part of the binary interface");
_Static_assert(sizeof(TONEWRIGHT_PluginInfo) == 80, "the record is part of the binary interface");
_Static_assert(sizeof(TONEWRIGHT_TagPicture) == 56, "the record is part of the binary interface");

/* Passes a record as a host that knows only its first two fields would. */
int32_t cReadShortRecord(TONEWRIGHT_Handle source, int32_t* rate) {
    TONEWRIGHT_MediaInfo info;
    info.channelCount = -1;
    info.size = offsetof(TONEWRIGHT_MediaInfo, channelCount);
    const int32_t result = TONEWRIGHT_Host_GetMediaInfo(source, &info);
    *rate = info.sampleRate;
    return result == 1 && info.channelCount == -1 &&
           info.size == offsetof(TONEWRIGHT_MediaInfo, channelCount);
}
