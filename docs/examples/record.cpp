// Records from the default input device: record FILE SECONDS
#include "peru/Errors.h"
#include "peru/IInstanceWrapper.h"
#include "peru/media/ISystem.h"
#include "peru/system/IPathes.h"
#include "tonewright/tonewright.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <memory>

namespace {

constexpr int32_t kSampleRate = 44100;
constexpr int32_t kChannelCount = 2;
constexpr int32_t kBytesPerSample = 2;

struct SHandleEnd {
    void operator()(TONEWRIGHT_HandleData* handle) const { TONEWRIGHT_DestroyHandle(handle); }
};
using CHandle = std::unique_ptr<TONEWRIGHT_HandleData, SHandleEnd>;

// Ends the library after everything that was made with it.
struct SLibrary {
    const int32_t status = TONEWRIGHT_InitStartup();
    ~SLibrary() { TONEWRIGHT_DeInitAll(); }
};

// Callbacks come without a word of the caller's, so what they need is global.
std::atomic<double> g_seconds{0.0};

bool onProgress(double position) {
    return position < g_seconds;
}

void onVolume(double left, double right) {
    std::printf("\r%3.0f %% %3.0f %%", left * 100.0, right * 100.0);
    std::fflush(stdout);
}

// The library takes the object over: the handle ends it.
CHandle wrap(peru::P<peru::IBase> object) {
    peru::IInstanceWrapper* wrapper = new peru::CInstanceWrapper(std::move(object));
    return CHandle(reinterpret_cast<TONEWRIGHT_Handle>(wrapper));
}

int fail(const char* text) {
    std::fprintf(stderr, "record: %s\n", text);
    return 1;
}

int record(const char* file) {
    const SLibrary library;
    if (library.status != TONEWRIGHT_OK) return fail("the library does not start");
    const peru::P<peru::media::IAudioInDevice> device = peru::media::getSystem()->getDefaultInDevice();
    if (!device) return fail("there is no input device");

    const CHandle deviceHandle = wrap(device);
    const CHandle source(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(deviceHandle.get(), kSampleRate,
                                                                      kChannelCount, kBytesPerSample));
    if (!source) return fail("the device does not record in this format");
    TONEWRIGHT_AudioSource_SetRecordingCallback(source.get(), onProgress);
    TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(source.get(), onVolume);

    const std::u16string uri =
        peru::CString::toStdU16String(peru::getPathes()->fromPlatformPath(file)->getAsString());
    const CHandle format(TONEWRIGHT_CreateAudioFormatFromURI(uri.c_str(), kSampleRate, kChannelCount,
                                                             kBytesPerSample, 0.0, 0, 0, 0));
    if (!format) return fail("the file's extension is not known");
    const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source.get(), format.get()));
    if (!encoder) return fail("there is no encoder");

    // Opens the source and so starts the device; returns some milliseconds after onProgress has said false.
    const int32_t status = TONEWRIGHT_AudioEncoder_Encode(encoder.get());
    std::printf("\n");
    return status == TONEWRIGHT_OK ? 0 : fail("the recording has failed; the log on standard error says why");
}

} // namespace

int main(int argc, char** argv) {
    g_seconds = argc == 3 ? std::atof(argv[2]) : 0.0;
    if (!(g_seconds > 0.0)) {
        std::fprintf(stderr, "usage: record FILE SECONDS\n");
        return 2;
    }
    try {
        return record(argv[1]);
    } catch (const std::exception& error) {
        return fail(error.what());
    }
}
