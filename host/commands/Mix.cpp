// tonewright mix
#include "commands/Mix.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Translation.h"
#include "media/Arrangement.h"
#include "media/EncodeJob.h"
#include "media/Output.h"

#include <chrono>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

void mix(CLibrary& library, const SMixOptions& options, CProgress& progress, CProgress::Job job) {
    const auto started = std::chrono::steady_clock::now();
    const SSampleFormat samples{options.rate.value_or(44100), options.channels.value_or(2), 2};
    checkInput(options.input);
    if (isSameFile(options.input, options.output))
        throw std::runtime_error(tr("host.sameFile", "Input and output are the same file"));
    const std::string ending = setTemporaryEnding(library);
    COutput place(options.output, ending, options.force);
    const fs::path& temporary = place.getTemporary();

    CHandle source = openArrangement(library, options.input, samples);
    CHandle format =
        requireFormat(library, temporary, samples, options, options.output, options.output.string());
    const double duration = library.AudioSource_GetDuration(source.get());
    if (!encode(library, source, format, progress, job, {options.input, temporary, options.output}, ending))
        return progress.cancel(job);
    source.reset();
    format.reset();
    const uint64_t bytes = fs::file_size(temporary);
    place.commit();
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    progress.finish(job, {duration, elapsed.count(), bytes, codecName(options.output)});
}

} // namespace

int mix(CLibrary& library, const SMixOptions& options) {
    requireEffect(options, options.output);
    CProgress progress(options.show);
    const CProgress::Job job = progress.start(options.input, options.output, nlohmann::json::object());
    try {
        mix(library, options, progress, job);
        return isCancelled() ? kExitCancelled : kExitSuccess;
    } catch (const std::exception& failure) {
        progress.fail(job, failure.what());
        return kExitFailure;
    }
}

} // namespace host
