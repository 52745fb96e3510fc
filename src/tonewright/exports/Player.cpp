#include "tonewright/Player.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright;
using namespace tonewright::exports;

namespace {

// Runs an operation on the player behind the handle and keeps the player alive meanwhile, even if the handle
// is destroyed.
template <class Operation> int32_t withPlayer(TONEWRIGHT_Handle handle, Operation&& operation) {
    return barrier<int32_t>(TONEWRIGHT_PLAYER_FAILED, [&] {
        const P<CPlayer> player = unwrap<CPlayer>(handle);
        if (!player) return TONEWRIGHT_PLAYER_FAILED;
        operation(*player);
        return TONEWRIGHT_OK;
    });
}

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromURI(const char16_t* uri) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<CApp> app = requireApp();
        return wrap(peru::make<CPlayer>(toURI(uri), app->getReadPluginHandler()));
    });
}

TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromAudioSource(TONEWRIGHT_Handle source) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<sonora2::common::IAudioSource> object = unwrap<sonora2::common::IAudioSource>(source);
        if (!object) return nullptr;
        requireApp(); // the sound system is a singleton that ends with it
        return wrap(peru::make<CPlayer>(object));
    });
}

int32_t TONEWRIGHT_Player_Play(TONEWRIGHT_Handle player) {
    return withPlayer(player, [](CPlayer& object) { object.play(); });
}

int32_t TONEWRIGHT_Player_Pause(TONEWRIGHT_Handle player) {
    return withPlayer(player, [](CPlayer& object) { object.pause(); });
}

int32_t TONEWRIGHT_Player_Stop(TONEWRIGHT_Handle player) {
    return withPlayer(player, [](CPlayer& object) { object.stop(); });
}

int32_t TONEWRIGHT_Player_SetCallback(TONEWRIGHT_Handle player, TONEWRIGHT_PlayerCallback callback) {
    return withPlayer(player, [callback](CPlayer& object) { object.setCallback(callback); });
}
