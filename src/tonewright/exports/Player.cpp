#include "tonewright/exports/AppReference.h"

using namespace tonewright::exports;

TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromURI(const char16_t*) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_CreatePlayerFromURI", nullptr);
}

TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromAudioSource(TONEWRIGHT_Handle) {
    return notAvailable<TONEWRIGHT_Handle>("TONEWRIGHT_CreatePlayerFromAudioSource", nullptr);
}

int32_t TONEWRIGHT_Player_Play(TONEWRIGHT_Handle) {
    return notAvailable<int32_t>("TONEWRIGHT_Player_Play", TONEWRIGHT_PLAYER_FAILED);
}

int32_t TONEWRIGHT_Player_Pause(TONEWRIGHT_Handle) {
    return notAvailable<int32_t>("TONEWRIGHT_Player_Pause", TONEWRIGHT_PLAYER_FAILED);
}

int32_t TONEWRIGHT_Player_Stop(TONEWRIGHT_Handle) {
    return notAvailable<int32_t>("TONEWRIGHT_Player_Stop", TONEWRIGHT_PLAYER_FAILED);
}

int32_t TONEWRIGHT_Player_SetCallback(TONEWRIGHT_Handle, TONEWRIGHT_PlayerCallback) {
    return notAvailable<int32_t>("TONEWRIGHT_Player_SetCallback", TONEWRIGHT_PLAYER_FAILED);
}
