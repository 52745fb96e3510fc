#include "commands/Convert.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Parallel.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ConversionPlan.h"
#include "commands/ConversionSource.h"
#include "library/Failure.h"
#include "media/EncodeJob.h"
#include "media/GainTags.h"
#include "media/InputContent.h"
#include "media/Loudness.h"
#include "media/Output.h"
#include "media/SoundFile.h"
#include "media/Warnings.h"

#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <optional>
#include <stdexcept>
#include <sys/stat.h>
#include <utility>

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

// The part of a job's progress that measuring the input takes.
constexpr double kMeasuring = 0.5;

class CConverter {
public:
    CConverter(CLibrary& library, const SConvertOptions& options, const std::vector<SConversion>& plan,
               CProgress& progress)
        : m_library(library), m_options(options), m_plan(plan), m_progress(progress),
          m_temporaryEnding(setTemporaryEnding(library)), m_prepared(plan.size()) {}

    // Finds the gain that brings all inputs together to the loudness, if they are to have the same one.
    void prepareAll();
    // True if the file was written or may be skipped. Thread-safe for different indices.
    bool run(size_t index);
    // Prints what run() would do; creates nothing.
    bool show(size_t index);

private:
    // What is known of a conversion before it starts.
    struct SPrepared {
        std::optional<CProgress::Job> job;
        std::unique_ptr<CInputContent> content;
        CHandle measurement;
        std::string problem;
    };
    struct SWritten {
        double duration;
        std::optional<double> gain;
    };

    void prepare(size_t index);
    CProgress::Job start(size_t index);
    bool convert(size_t index, CProgress::Job job);
    std::optional<SWritten> write(const SEncodeFiles& files, CProgress::Job job);
    bool isSkipped(const SConversion& conversion) const;
    CHandle measure(const CConversionSource& source, CProgress::Job job);
    double chooseGain(const TONEWRIGHT_Loudness& loudness, CProgress::Job job);
    void carryTag(const fs::path& input, const fs::path& temporary, const fs::path& output,
                  CProgress::Job job);

    CLibrary& m_library;
    const SConvertOptions& m_options;
    const std::vector<SConversion>& m_plan;
    CProgress& m_progress;
    const std::string m_temporaryEnding;
    std::vector<SPrepared> m_prepared; // one for each conversion
    std::optional<double> m_gain;      // of all outputs, in decibels
};

CProgress::Job CConverter::start(size_t index) {
    const SConversion& conversion = m_plan[index];
    return m_progress.start(conversion.input, conversion.output, nlohmann::json::object());
}

CHandle CConverter::measure(const CConversionSource& source, CProgress::Job job) {
    CHandle measurement =
        source.measure([&](double fraction) { m_progress.advance(job, fraction * kMeasuring); });
    dropWarnings(source.getSource()); // encoding repeats them
    return measurement;
}

void CConverter::prepare(size_t index) {
    const SConversion& conversion = m_plan[index];
    SPrepared& prepared = m_prepared[index];
    if (!conversion.problem.empty()) return;
    prepared.job = start(index);
    try {
        prepared.content = std::make_unique<CInputContent>(conversion.input);
        if (isCancelled()) return;
        fs::path target = conversion.output;
        if (isStandardStream(target)) target = fs::path("output").replace_extension(m_options.extension);
        CConversionSource source(prepared.content->getPath(), target, m_options);
        source.deliver();
        prepared.measurement = measure(source, *prepared.job);
    } catch (const std::exception& error) {
        prepared.problem = error.what();
    }
    m_progress.pause(*prepared.job);
}

// Inputs whose outputs are skipped count as well, so that a repeated run finds the same gain.
void CConverter::prepareAll() {
    if (!m_options.oneGain || m_options.dryRun) return;
    runParallel(m_plan.size(), m_options.jobs, [&](size_t index) { prepare(index); });
    if (isCancelled()) {
        for (const SPrepared& prepared : m_prepared)
            if (prepared.job) m_progress.cancel(*prepared.job);
        return;
    }
    std::vector<TONEWRIGHT_Handle> measurements;
    CProgress::Job loudest = 0;
    double peak = -1.0;
    for (SPrepared& prepared : m_prepared) {
        if (!prepared.measurement) continue;
        measurements.push_back(prepared.measurement.get());
        if (const double own = getLoudness({measurements.back()}).truePeak; own > peak) {
            peak = own;
            loudest = *prepared.job;
        }
    }
    if (!measurements.empty()) m_gain = chooseGain(getLoudness(measurements), loudest);
}

double CConverter::chooseGain(const TONEWRIGHT_Loudness& loudness, CProgress::Job job) {
    if (!isMeasurable(loudness))
        m_progress.warn(job, tr("host.Convert.notMeasurable",
                                "The sound is too quiet or too short for its loudness to be measured; its "
                                "level is not changed"));
    const SGain gain = findGain(loudness, *m_options.loudness);
    if (m_options.allowClipping) return gain.wanted;
    const std::string wanted = formatDecibels(gain.wanted, true),
                      limited = formatDecibels(gain.limited, true);
    if (wanted != limited)
        m_progress.warn(job, tr("host.Convert.limited",
                                "The gain is limited to %LIMITED% dB instead of %WANTED% dB to prevent "
                                "clipping (--allow-clipping applies all of it)",
                                {{"%LIMITED%", limited}, {"%WANTED%", wanted}}));
    return gain.limited;
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

bool CConverter::isSkipped(const SConversion& conversion) const {
    std::error_code none;
    return m_options.existing == EExisting::skip && conversion.problem.empty() &&
           !isStandardStream(conversion.output) && fs::is_regular_file(conversion.output, none);
}

// Empty if Ctrl-C ended it.
std::optional<CConverter::SWritten> CConverter::write(const SEncodeFiles& files, CProgress::Job job) {
    CConversionSource source(files.input, files.temporary, m_options);
    const CHandle format = requireFormat(m_library, files.temporary, source.getSamples(), m_options,
                                         files.output, files.output.string());
    source.deliver();
    SWritten written{m_library.AudioSource_GetDuration(source.getSource().get()), m_gain};
    if (m_options.loudness && !m_gain) {
        const CHandle measurement = measure(source, job);
        if (!measurement) return std::nullopt;
        written.gain = chooseGain(getLoudness({measurement.get()}), job);
    }
    CHandle gained;
    if (written.gain) gained = source.createGainSource(*written.gain);
    const bool done = encode(m_library, gained ? gained : source.getSource(), format, m_progress, job, files,
                             m_temporaryEnding, written.gain ? kMeasuring : 0.0);
    reportWarnings(source.getSource(), files.input, m_progress, job);
    if (!done) return std::nullopt;
    return written;
}

// False if it did not end with a result, without a reason to report.
bool CConverter::convert(size_t index, CProgress::Job job) {
    const SConversion& conversion = m_plan[index];
    const SPrepared prepared = std::exchange(m_prepared[index], {});
    const auto started = std::chrono::steady_clock::now();
    for (const std::string& problem : {conversion.problem, prepared.problem})
        if (!problem.empty()) throw std::runtime_error(problem);
    std::optional<CInputContent> own;
    const CInputContent& content = prepared.content ? *prepared.content : own.emplace(conversion.input);
    if (isCancelled()) return false;
    const fs::path& input = content.getPath();

    std::optional<CPrivateFolder> spool;
    fs::path target = conversion.output;
    if (isStandardStream(target)) {
        spool.emplace();
        target = spool->getPath() / "output";
        target.replace_extension(m_options.extension);
    } else if (createsFolders(m_options)) {
        createFolders(target.parent_path());
    }
    COutput place(target, m_temporaryEnding, m_options.existing == EExisting::replace);
    const fs::path& temporary = place.getTemporary();
    const fs::path& output = conversion.output;

    const std::optional<SWritten> written = write({input, temporary, output}, job);
    if (!written) return false;
    if (m_options.carryTags) {
        carryTag(input, temporary, output, job);
        if (written->gain && *written->gain != 0.0) removeGainTags(temporary);
    }
    const uint64_t bytes = fs::file_size(temporary);
    if (m_options.carryTimes && !isStandardStream(conversion.input)) copyTimes(conversion.input, temporary);
    place.commit();
    if (spool && !copyToStandardOutput(target)) return false;
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    m_progress.finish(job, {written->duration, elapsed.count(), bytes, codecName(target), written->gain});
    return true;
}

bool CConverter::run(size_t index) {
    const CProgress::Job job = m_prepared[index].job ? *m_prepared[index].job : start(index);
    try {
        if (isSkipped(m_plan[index])) {
            m_progress.skip(job);
        } else if (!convert(index, job)) {
            m_progress.cancel(job);
            return false;
        }
        return !isCancelled();
    } catch (const std::exception& error) {
        m_progress.fail(job, error.what());
        return false;
    }
}

bool CConverter::show(size_t index) {
    const SConversion& conversion = m_plan[index];
    const CProgress::Job job = start(index);
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
    CConverter converter(library, options, plan, progress);
    converter.prepareAll();

    std::atomic<bool> failed{false};
    runParallel(plan.size(), options.dryRun ? 1 : options.jobs, [&](size_t index) {
        if (!(options.dryRun ? converter.show(index) : converter.run(index))) failed = true;
    });
    return isCancelled() ? kExitCancelled : failed ? kExitFailure : kExitSuccess;
}

} // namespace host
