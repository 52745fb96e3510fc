#include "media/EncodeJob.h"

#include "base/Cancel.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <stdexcept>
#include <tonewright/host.h>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

struct SRunning {
    CProgress& progress;
    CProgress::Job job;
    double begin;
    bool stopped = false;
};

int32_t onProgress(double fraction, void* user) {
    auto& running = *static_cast<SRunning*>(user);
    const double done = std::clamp(fraction, 0.0, 1.0);
    running.progress.advance(running.job, running.begin + done * (1.0 - running.begin));
    running.stopped = isCancelled();
    return running.stopped ? TONEWRIGHT_DISCARD : TONEWRIGHT_CONTINUE;
}

// Messages name the target instead of the temporary file.
std::string tellReason(const SEncodeFiles& files, const std::string& temporaryEnding) {
    std::string reason = takeFailure(tr("host.Convert.failed", "The conversion failed"));
    const fs::path absolute = fs::absolute(files.temporary);
    for (const std::string& shown : {absolute.lexically_normal().native(), absolute.native()})
        replaceAll(reason, shown, files.output.native());
    replaceAll(reason, temporaryEnding, ""); // in case the message spells the path differently
    replaceAll(reason, "The file '" + files.output.native() + "' could not be written: ", "");
    return asReason(std::move(reason), files.input);
}

CHandle createFormat(CLibrary& library, const fs::path& temporary, const SSampleFormat& samples,
                     const SFormatOptions& options) {
    const double quality = options.quality ? std::max(*options.quality, 1e-9) : 0.0; // 0.0 means unset
    clearFailure();
    return CHandle(library.CreateAudioFormatFromURI(toURI(temporary).c_str(), samples.rate, samples.channels,
                                                    samples.bytesPerSample, quality, options.bitRate,
                                                    options.minBitRate, options.maxBitRate));
}

} // namespace

std::string setTemporaryEnding(CLibrary& library) {
    const std::string ending = ".part" + std::to_string(::getpid());
    library.SetTempExtension(std::u16string(ending.begin(), ending.end()).c_str());
    return ending;
}

CHandle requireFormat(CLibrary& library, const fs::path& temporary, const SSampleFormat& samples,
                      const SFormatOptions& options, const fs::path& output, const std::string& subject) {
    CHandle format = createFormat(library, temporary, samples, options);
    if (format) return format;
    std::string reason = takeFailure(tr("host.cannotHold", "%FILE% cannot hold %FORMAT%",
                                        {{"%FILE%", subject}, {"%FORMAT%", describe(samples)}}));
    replaceAll(reason, temporary.native(), output.native());
    replaceAll(reason, temporary.filename().native(), output.filename().native());
    throw std::runtime_error(reason);
}

bool encode(CLibrary& library, const CHandle& source, const CHandle& format, CProgress& progress,
            CProgress::Job job, const SEncodeFiles& files, const std::string& temporaryEnding, double begin) {
    clearFailure();
    SRunning running{progress, job, begin};
    int32_t result = TONEWRIGHT_ENCODER_FAILED;
    {
        // Creating the encoder opens the source briefly, which may already fail.
        const CHandle encoder(library.CreateAudioEncoder(source.get(), format.get()));
        if (encoder) {
            TONEWRIGHT_Host_SetEncoderProgress(encoder.get(), onProgress, &running);
            result = library.AudioEncoder_Encode(encoder.get());
        }
    }
    if (running.stopped) return false;
    if (result != TONEWRIGHT_OK) throw std::runtime_error(tellReason(files, temporaryEnding));
    return true;
}

} // namespace host
