#include "commands/Convert.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ConversionPlan.h"
#include "library/Failure.h"
#include "media/EncodeJob.h"
#include "media/InputContent.h"
#include "media/Output.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <sys/stat.h>
#include <system_error>
#include <thread>

namespace host {

namespace fs = std::filesystem;

namespace {

// Of reading and of modification.
void copyTimes(const fs::path& from, const fs::path& to) {
    struct stat status;
    if (::stat(from.c_str(), &status) != 0) return;
    const struct timespec times[] = {status.st_atim, status.st_mtim};
    if (::utimensat(AT_FDCWD, to.c_str(), times, 0) != 0)
        throw std::runtime_error(tr("host.Convert.times", "The times of the input cannot be copied: %REASON%",
                                    {{"%REASON%", std::strerror(errno)}}));
}

class CConverter {
public:
    CConverter(CLibrary& library, const SConvertOptions& options, CProgress& progress)
        : m_library(library), m_options(options), m_progress(progress),
          m_temporaryEnding(setTemporaryEnding(library)) {}

    // True if the file was written or may be skipped. Thread-safe.
    bool run(const SConversion& conversion);
    // Prints what run() would do; creates nothing.
    bool show(const SConversion& conversion);

private:
    struct SEnds {
        CHandle source;
        CHandle format;
    };

    bool convert(const SConversion& conversion, CProgress::Job job);
    bool isSkipped(const SConversion& conversion) const;
    void carryTag(const fs::path& input, const fs::path& temporary, const fs::path& output,
                  CProgress::Job job);
    void warn(const CHandle& source, const fs::path& input, CProgress::Job job);
    SEnds openEnds(const fs::path& input, const fs::path& temporary, const fs::path& output);
    std::vector<SSampleFormat> listCandidates(const SSampleFormat& own) const;

    CLibrary& m_library;
    const SConvertOptions& m_options;
    CProgress& m_progress;
    std::string m_temporaryEnding;
};

// The preferred format first, then those that most targets can hold. Values set by the user never change.
std::vector<SSampleFormat> CConverter::listCandidates(const SSampleFormat& own) const {
    std::vector<SSampleFormat> candidates;
    const auto add = [&](int rate, int channels, int bytes) {
        const SSampleFormat candidate{m_options.rate.value_or(rate), m_options.channels.value_or(channels),
                                      m_options.bits ? *m_options.bits / 8 : bytes};
        if (std::find(candidates.begin(), candidates.end(), candidate) == candidates.end())
            candidates.push_back(candidate);
    };
    // Rates that a limited codec may accept: the next higher ones first, a lower one only if there are none.
    std::vector<int> rates{own.rate};
    for (int rate : {8000, 11025, 16000, 22050, 32000, 44100, 48000})
        if (rate > own.rate) rates.push_back(rate);
    if (rates.size() == 1) rates.push_back(own.rate % 11025 == 0 ? 44100 : 48000);
    for (int rate : rates)
        for (int channels : {own.channels, 2, 1})
            for (int bytes : {own.bytesPerSample, 3, 2})
                if (channels <= own.channels && bytes <= std::max(own.bytesPerSample, 2))
                    add(rate, channels, bytes);
    return candidates;
}

// Creates a format that the target can hold, and a source that delivers it. The input is opened only once.
CConverter::SEnds CConverter::openEnds(const fs::path& input, const fs::path& temporary,
                                       const fs::path& output) {
    SSoundFile sound = openSoundFile(input);
    const std::u16string target = toURI(temporary);
    const std::vector<SSampleFormat> candidates = listCandidates(sound.samples);
    const auto fits = [&](const SSampleFormat& samples) {
        return TONEWRIGHT_Host_CanWrite(target.c_str(), samples.rate, samples.channels,
                                        samples.bytesPerSample) == 1;
    };
    const auto found = std::find_if(candidates.begin(), candidates.end(), fits);
    const SSampleFormat samples = found == candidates.end() ? candidates.front() : *found;

    SEnds ends;
    ends.format = requireFormat(m_library, temporary, samples, m_options, output, output.string());
    clearFailure();
    // A width that the user asks for means integers, also where the target could hold floating point.
    if ((samples != sound.samples || m_options.bits) &&
        TONEWRIGHT_Host_SetSourceFormat(sound.source.get(), samples.rate, samples.channels,
                                        samples.bytesPerSample) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.inconvertible", "Cannot be converted from %FROM% to %TO%",
                           {{"%FROM%", describe(sound.samples)}, {"%TO%", describe(samples)}}),
                        input));
    ends.source = std::move(sound.source);
    if (m_options.salvage) TONEWRIGHT_Host_SetSalvage(ends.source.get(), 1);
    if (m_options.preventClipping) TONEWRIGHT_Host_SetClippingPrevention(ends.source.get(), 1);
    return ends;
}

// Fields that the output's format cannot hold are omitted with a warning. A tag that cannot be read does not
// fail the conversion.
void CConverter::carryTag(const fs::path& input, const fs::path& temporary, const fs::path& output,
                          CProgress::Job job) {
    clearFailure();
    char* lost = nullptr;
    const int32_t copied = TONEWRIGHT_Host_CopyTags(toURI(input).c_str(), toURI(temporary).c_str(), &lost);
    if (copied == 0)
        return m_progress.warn(job, tr("host.Convert.tagUnread",
                                       "The tag could not be read and is not copied: %REASON%",
                                       {{"%REASON%", takeFailure(tr("host.unknown", "unknown"), input)}}));
    if (copied < 0) {
        std::string reason = takeFailure(tr("host.unknown", "unknown"), temporary);
        replaceAll(reason, m_temporaryEnding, "");
        throw std::runtime_error(tr("host.Convert.tagUnwritten",
                                    "The tag of %FILE% could not be written: %REASON%",
                                    {{"%FILE%", output.native()}, {"%REASON%", reason}}));
    }
    if (lost)
        m_progress.warn(job,
                        tr("host.Convert.lost", "The new file cannot hold these fields of the tag: %LIST%",
                           {{"%LIST%", lost}}));
    TONEWRIGHT_Host_Free(lost);
}

// Reports the decoder's warnings.
void CConverter::warn(const CHandle& source, const fs::path& input, CProgress::Job job) {
    char* const lines = TONEWRIGHT_Host_TakeWarnings(source.get());
    if (!lines) return;
    std::istringstream text(lines);
    TONEWRIGHT_Host_Free(lines);
    for (std::string line; std::getline(text, line);) m_progress.warn(job, asReason(withPaths(line), input));
}

bool CConverter::isSkipped(const SConversion& conversion) const {
    std::error_code none;
    return m_options.existing == EExisting::skip && conversion.problem.empty() &&
           !isStandardStream(conversion.output) && fs::is_regular_file(conversion.output, none);
}

// False if it did not end with a result, without a reason to report.
bool CConverter::convert(const SConversion& conversion, CProgress::Job job) {
    const auto started = std::chrono::steady_clock::now();
    if (!conversion.problem.empty()) throw std::runtime_error(conversion.problem);
    const CInputContent content(conversion.input);
    if (isCancelled()) return false;
    const fs::path& input = content.getPath();

    std::optional<CPrivateFolder> spool;
    fs::path target = conversion.output;
    if (isStandardStream(target)) {
        spool.emplace();
        target = spool->getPath() / "output";
        target.replace_extension(m_options.extension);
    } else if (createsFolders(m_options) && target.has_parent_path()) {
        std::error_code error;
        fs::create_directories(target.parent_path(), error);
        if (error)
            throw std::runtime_error(
                tr("host.folderNotCreated", "The folder %FOLDER% cannot be created: %REASON%",
                   {{"%FOLDER%", target.parent_path().string()}, {"%REASON%", error.message()}}));
    }
    COutput place(target, m_temporaryEnding, m_options.existing == EExisting::replace);
    const fs::path& temporary = place.getTemporary();
    const fs::path& output = conversion.output;

    SEnds ends = openEnds(input, temporary, output);
    const double duration = m_library.AudioSource_GetDuration(ends.source.get());
    const bool done = encode(m_library, ends.source, ends.format, m_progress, job, {input, temporary, output},
                             m_temporaryEnding);
    warn(ends.source, input, job);
    ends = {};
    if (!done) return false;
    if (m_options.carryTags) carryTag(input, temporary, output, job);
    const uint64_t bytes = fs::file_size(temporary);
    if (m_options.carryTimes && !isStandardStream(conversion.input)) copyTimes(conversion.input, temporary);
    place.commit();
    if (spool && !copyToStandardOutput(target)) return false;
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    m_progress.finish(job, {duration, elapsed.count(), bytes, codecName(target)});
    return true;
}

bool CConverter::run(const SConversion& conversion) {
    const CProgress::Job job =
        m_progress.start(conversion.input, conversion.output, nlohmann::json::object());
    try {
        if (isSkipped(conversion)) {
            m_progress.skip(job);
        } else if (!convert(conversion, job)) {
            m_progress.cancel(job);
            return false;
        }
        return !isCancelled();
    } catch (const std::exception& error) {
        m_progress.fail(job, error.what());
        return false;
    }
}

bool CConverter::show(const SConversion& conversion) {
    const CProgress::Job job =
        m_progress.start(conversion.input, conversion.output, nlohmann::json::object());
    try {
        if (isSkipped(conversion)) {
            m_progress.skip(job);
            return true;
        }
        if (const std::string problem = findProblem(conversion, m_options); !problem.empty())
            throw std::runtime_error(problem);
        std::error_code none;
        m_progress.plan(job, !isStandardStream(conversion.output) && fs::exists(conversion.output, none));
        return true;
    } catch (const std::exception& error) {
        m_progress.fail(job, error.what());
        return false;
    }
}

} // namespace

int convert(CLibrary& library, const SConvertOptions& options) {
    fs::path target = "output";
    target.replace_extension(options.extension);
    requireEffect(options, options.extension.empty() ? options.output : target);
    // Read whenever a conversion starts; no other thread runs yet.
    if (!options.resampler.empty()) ::setenv("TONEWRIGHT_RESAMPLER", options.resampler.c_str(), 1);
    const std::vector<SConversion> plan = planConversions(library, options);
    CProgress progress(options.show, isStandardStream(options.output) ? stderr : stdout);
    CConverter converter(library, options, progress);

    std::atomic<size_t> next{0};
    std::atomic<bool> failed{false};
    const auto work = [&] {
        for (size_t i; !isCancelled() && (i = next++) < plan.size();)
            if (!(options.dryRun ? converter.show(plan[i]) : converter.run(plan[i]))) failed = true;
    };
    std::vector<std::thread> others;
    const size_t threads =
        options.dryRun ? 1 : std::min<size_t>(static_cast<size_t>(options.jobs), plan.size());
    try {
        for (size_t i = 1; i < threads; ++i) others.emplace_back(work);
    } catch (const std::system_error&) {
        // No more threads available: the existing ones do all the work.
    }
    work();
    for (std::thread& thread : others) thread.join();
    return isCancelled() ? kExitCancelled : failed ? kExitFailure : kExitSuccess;
}

} // namespace host
