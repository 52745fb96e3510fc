// Equalizers and the factory that provides them.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

#include <cstdint>

namespace sonora2::audio {

using peru::P;

class SONORA2_API IAudioEqualizer : public virtual peru::IBase {
public:
    virtual void configure(int sampleRate, int bytesPerSample, int channelCount) = 0;
    virtual void select(int preset) = 0;
    virtual void process(uint8_t* samples, int64_t bytes) = 0; // in place
};

class SONORA2_API IAudioToolsHandler : public virtual peru::IBase {
public:
    virtual P<IAudioEqualizer> createEqualizer() = 0; // may be empty
};

using AudioToolsHandlerFactory = P<IAudioToolsHandler> (*)();

// Registers the provider of the audio tools; null removes it. Without audio tools, presets have no effect.
SONORA2_API void setAudioToolsHandlerFactory(AudioToolsHandlerFactory factory);
SONORA2_API P<IAudioToolsHandler> createAudioToolsHandler(); // empty without audio tools

} // namespace sonora2::audio
