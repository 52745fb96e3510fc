// The library that equalizes the tracks of track lists.
#pragma once

#include "peru/system/IDynamicLibrary.h"
#include "sonora2/tracks/IAudioEqualizer.h"

namespace audiotoolshandler {

using peru::P;

// A singleton of the global object factory. Thread-safe.
class CAudioToolsHandler : public peru::CObject, public sonora2::audio::IAudioToolsHandler {
public:
    // Loads the library on the first call. Throws CError if it is missing.
    static P<CAudioToolsHandler> get();

    // Throws CError if the library has no equalizer. The result may outlive this object.
    P<sonora2::audio::IAudioEqualizer> createEqualizer() override;

protected:
    CAudioToolsHandler();
    ~CAudioToolsHandler() override;

private:
    const P<peru::IDynamicLibrary> m_library;
};

// For sonora2::audio::setAudioToolsHandlerFactory(): empty, with the reason in the log, if the library cannot
// be loaded.
P<sonora2::audio::IAudioToolsHandler> findAudioToolsHandler();

} // namespace audiotoolshandler
