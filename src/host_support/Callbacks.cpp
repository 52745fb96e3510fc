// Callbacks with user data, and the control of a player.
#include "host_support/Guard.h"
#include "peru/media/ISystem.h"
#include "peru/strings/LocalizedFormat.h"
#include "tonewright/ICallbackTargets.h"

using namespace tonewright;
using namespace tonewright::host_support;

int32_t TONEWRIGHT_Host_SetEncoderProgress(TONEWRIGHT_Handle encoder, TONEWRIGHT_EncoderProgress callback,
                                           void* user) {
    return guard(0, [&] {
        const P<IEncoderProgressTarget> target = require<IEncoderProgressTarget>(encoder, "an encoder");
        if (!callback) {
            target->setProgressFunction(nullptr);
            return 1;
        }
        // The target owns the function, so the function must not own the target.
        target->setProgressFunction([callback, user, raw = target.get()](double fraction) {
            const int32_t answer = callback(fraction, user);
            if (answer == TONEWRIGHT_DISCARD) raw->stopAndDiscard();
            return answer == TONEWRIGHT_CONTINUE;
        });
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetPlayerProgress(TONEWRIGHT_Handle player, TONEWRIGHT_PlayerProgress callback,
                                          void* user) {
    return guard(0, [&] {
        std::function<void(double, double, int32_t)> function;
        if (callback)
            function = [callback, user](double duration, double position, int32_t state) {
                callback(duration, position, state, user);
            };
        require<IPlayerProgressTarget>(player, "a player")->setProgressFunction(std::move(function));
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetRecordingProgress(TONEWRIGHT_Handle source, TONEWRIGHT_RecordingProgress callback,
                                             void* user) {
    return guard(0, [&] {
        std::function<bool(double)> function;
        if (callback)
            function = [callback, user](double position) {
                return callback(position, user) == TONEWRIGHT_CONTINUE;
            };
        require<IRecordingTarget>(source, "a recording")->setProgressFunction(std::move(function));
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetRecordingLevels(TONEWRIGHT_Handle source, TONEWRIGHT_RecordingLevels callback,
                                           void* user) {
    return guard(0, [&] {
        std::function<void(double, double)> function;
        if (callback) function = [callback, user](double left, double right) { callback(left, right, user); };
        require<IRecordingTarget>(source, "a recording")->setLevelFunction(std::move(function));
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SeekPlayer(TONEWRIGHT_Handle player, double seconds) {
    return guard(0, [&] {
        require<IPlayerControl>(player, "a player")->seek(seconds);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetPlayerVolume(TONEWRIGHT_Handle player, double factor) {
    return guard(0, [&] {
        require<IPlayerControl>(player, "a player")->setVolume(factor);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetPlayerDevice(TONEWRIGHT_Handle player, const char* id) {
    return guard(0, [&] {
        const P<IPlayerControl> control = require<IPlayerControl>(player, "a player");
        for (auto devices = peru::media::getSystem()->getOutDevices(); devices.hasMore();) {
            const auto device = devices.getNext();
            if (!id || peru::CString::toStdString(device->getId()) != id) continue;
            control->setDevice(device);
            return 1;
        }
        throw peru::CError(peru::format({"tonewright.Devices.noSuchOutput", "There is no output device %s"},
                                        peru::CString::fromUTF8(id ? id : "")));
    });
}

int32_t TONEWRIGHT_Host_EnqueueSource(TONEWRIGHT_Handle player, TONEWRIGHT_Handle source) {
    return guard(0, [&] {
        const auto next = require<sonora2::common::IAudioSource>(source, "an audio source");
        if (!require<IPlayerControl>(player, "a player")->enqueue(next))
            throw peru::CError(peru::localize("tonewright.Player.otherFormat",
                                              "The next source has a different format from the current one"));
        return 1;
    });
}

int32_t TONEWRIGHT_Host_GetPlayerSourceIndex(TONEWRIGHT_Handle player) {
    return guard(-1, [&] { return require<IPlayerControl>(player, "a player")->getSourceIndex(); });
}
