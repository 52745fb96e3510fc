#include "tonewright/exports/AppReference.h"

using namespace tonewright::exports;

TONEWRIGHT_Handle TONEWRIGHT_CreateFileTag(const char16_t*) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_CreateFileTag", nullptr);
}

int32_t TONEWRIGHT_StoreFileTag(TONEWRIGHT_Handle) {
    return notAvailable<int32_t>("TONEWRIGHT_StoreFileTag", TONEWRIGHT_FILE_TAG_FAILED);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetArtist(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetArtist", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbumArtist(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetAlbumArtist", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTitle(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetTitle", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbum(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetAlbum", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTrackNumber(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetTrackNumber", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetYear(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetYear", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetGenre(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetGenre", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetComment(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_FileTag_GetComment", nullptr);
}

void TONEWRIGHT_FileTag_SetArtist(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetArtist");
}

void TONEWRIGHT_FileTag_SetAlbumArtist(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetAlbumArtist");
}

void TONEWRIGHT_FileTag_SetTitle(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetTitle");
}

void TONEWRIGHT_FileTag_SetAlbum(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetAlbum");
}

void TONEWRIGHT_FileTag_SetTrackNumber(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetTrackNumber");
}

void TONEWRIGHT_FileTag_SetYear(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetYear");
}

void TONEWRIGHT_FileTag_SetGenre(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetGenre");
}

void TONEWRIGHT_FileTag_SetComment(TONEWRIGHT_Handle, const char16_t*) {
    logNotAvailable("TONEWRIGHT_FileTag_SetComment");
}
