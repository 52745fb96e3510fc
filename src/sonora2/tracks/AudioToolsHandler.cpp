#include "sonora2/tracks/IAudioEqualizer.h"

#include <atomic>

namespace sonora2::audio {

namespace {

std::atomic<AudioToolsHandlerFactory> g_factory{nullptr};

} // namespace

void setAudioToolsHandlerFactory(AudioToolsHandlerFactory factory) {
    g_factory = factory;
}

P<IAudioToolsHandler> createAudioToolsHandler() {
    const AudioToolsHandlerFactory factory = g_factory;
    return factory ? factory() : nullptr;
}

} // namespace sonora2::audio
