#include "commands/Record.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Devices.h"
#include "media/EncodeJob.h"
#include "media/Output.h"
#include "media/SoundFile.h"
#include "terminal/Keyboard.h"
#include "terminal/LiveLine.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <stdexcept>
#include <thread>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int kPollMilliseconds = 50;
constexpr const char* kTemporaryEnding = ".part";

// Shared by the device's thread and the thread that shows the state.
struct SState {
    std::atomic<double> start{-1}; // the device's time of the first block; negative before it
    std::atomic<double> position{0};
    std::atomic<double> left{0}; // peak level since last read
    std::atomic<double> right{0};
    std::atomic<bool> isStopped{false};
    double limit = 0; // seconds; 0: none
};

// The device's time starts before the first block arrives; the length of the recording is measured from that
// block.
int32_t onRecorded(double time, void* user) {
    auto& state = *static_cast<SState*>(user);
    if (state.start < 0) state.start = time;
    const double position = time - state.start;
    state.position = position;
    const bool goesOn = !state.isStopped && (state.limit <= 0 || position < state.limit);
    return goesOn ? TONEWRIGHT_CONTINUE : TONEWRIGHT_STOP;
}

void onLevels(double left, double right, void* user) {
    // Only this thread raises the levels, so at worst a reset between the two steps is lost.
    auto& state = *static_cast<SState*>(user);
    state.left = std::max<double>(state.left, left);
    state.right = std::max<double>(state.right, right);
}

// From -60 to 0 decibels.
std::string drawMeter(double level) {
    constexpr int kCells = 15;
    constexpr double kDecibelsPerCell = 4;
    const double cells = level > 0 ? kCells + 20 * std::log10(level) / kDecibelsPerCell : 0;
    const size_t filled = static_cast<size_t>(std::clamp(std::ceil(cells), 0.0, double{kCells}));
    return "[" + std::string(filled, '#') + std::string(kCells - filled, '.') + "]";
}

class CRecorder {
public:
    CRecorder(CLibrary& library, const SRecordOptions& options, CLiveLine& line)
        : m_library(library),
          m_options(options), m_samples{options.rate.value_or(44100), options.channels.value_or(2),
                                        options.bits.value_or(16) / 8},
          m_line(line) {
        const std::string ending = kTemporaryEnding;
        m_library.SetTempExtension(std::u16string(ending.begin(), ending.end()).c_str());
        m_state.limit = options.seconds;
    }

    // Returns when the user or the limit has ended the recording. Throws std::runtime_error if it ends in any
    // other way, in which case the part recorded so far is kept, and if the file cannot be written.
    void run(const CHandle& device);

private:
    CHandle openSource(const CHandle& device);
    void encode(const CHandle& source, const COutput& place);
    void watch(const std::atomic<bool>& hasEnded, const COutput& place);
    void finish(COutput& place);
    static uint64_t countBytes(const COutput& place) {
        std::error_code none;
        const uintmax_t bytes = fs::file_size(place.getTemporary(), none);
        return none ? 0 : bytes;
    }

    CLibrary& m_library;
    const SRecordOptions& m_options;
    const SSampleFormat m_samples;
    CLiveLine& m_line;
    SState m_state;
};

CHandle CRecorder::openSource(const CHandle& device) {
    clearFailure();
    CHandle source(m_library.CreateAudioSoureFromAudioInDevice(device.get(), m_samples.rate,
                                                               m_samples.channels, m_samples.bytesPerSample));
    if (source) {
        TONEWRIGHT_Host_SetRecordingProgress(source.get(), onRecorded, &m_state);
        TONEWRIGHT_Host_SetRecordingLevels(source.get(), onLevels, &m_state);
        if (m_library.AudioSource_Open(source.get()) == TONEWRIGHT_OK) return source;
    }
    const std::string reason = takeFailure("");
    const std::string text = tr("host.Record.format", "The sound device cannot record %FORMAT%",
                                {{"%FORMAT%", describe(m_samples)}});
    throw std::runtime_error(reason.empty() ? text : text + ": " + reason);
}

// Shows the state and handles keys until the recording has ended.
void CRecorder::watch(const std::atomic<bool>& hasEnded, const COutput& place) {
    CKeyboard keyboard;
    while (!hasEnded) {
        const char key = keyboard.wait(kPollMilliseconds);
        if (key == 'q' || key == 'Q' || isCancelled()) m_state.isStopped = true;
        if (!m_line.isDue()) continue;
        const double position = m_state.position, left = m_state.left.exchange(0),
                     right = m_state.right.exchange(0);
        const uint64_t bytes = countBytes(place);
        const std::string at = formatDuration(position) + ", " + formatSize(bytes);
        m_line.update(drawMeter(left) + " " + drawMeter(right) + "  " + at, at,
                      {{"position", position}, {"left", left}, {"right", right}, {"bytes", bytes}});
    }
}

// Returns when the recording has ended and everything that the device delivered is in the file.
void CRecorder::encode(const CHandle& source, const COutput& place) {
    const CHandle format = requireFormat(m_library, place.getTemporary(), m_samples, m_options,
                                         m_options.output, tr("host.theFile", "The file"));
    const CHandle encoder(m_library.CreateAudioEncoder(source.get(), format.get()));
    int32_t result = TONEWRIGHT_ENCODER_FAILED;
    std::string reason;
    std::atomic<bool> hasEnded{false};
    std::thread thread([&] {
        clearFailure();
        result = m_library.AudioEncoder_Encode(encoder.get());
        reason = takeFailure(tr("host.Record.failed", "The recording failed"));
        hasEnded = true;
    });
    watch(hasEnded, place);
    thread.join();
    if (result != TONEWRIGHT_OK) throw std::runtime_error(asReason(reason, place.getTemporary()));
}

void CRecorder::finish(COutput& place) {
    const double position = m_state.position;
    const bool wasWanted = m_state.isStopped || (m_state.limit > 0 && position >= m_state.limit);
    if (!wasWanted && m_state.start < 0)
        throw std::runtime_error(tr("host.Record.noSound", "The sound device delivers no sound"));
    const uint64_t bytes = countBytes(place);
    place.commit();
    if (!wasWanted)
        throw std::runtime_error(
            tr("host.Record.stopped",
               "The sound device stopped; the recording up to that point, %DURATION%, was saved",
               {{"%DURATION%", formatDuration(position)}}));
    const std::string codec = codecName(m_options.output);
    m_line.finish(codec + ", " + formatDuration(position) + ", " + formatSize(bytes),
                  {{"codec", codec}, {"duration", position}, {"bytes", bytes}});
}

// With --force, the remains of an earlier recording are removed only once this one can start.
void CRecorder::run(const CHandle& device) {
    requireFormat(m_library, m_options.output, m_samples, m_options, m_options.output,
                  tr("host.theFile", "The file"));
    if (!m_options.force) COutput(m_options.output, kTemporaryEnding, false, EGrowth::live).keep();
    const CHandle source = openSource(device);
    COutput place(m_options.output, kTemporaryEnding, m_options.force, EGrowth::live);
    bool isOver = false;
    try {
        encode(source, place);
        isOver = true;
        finish(place);
    } catch (const std::runtime_error& failure) {
        // A recording cannot be repeated, so whatever exists of it is kept.
        std::error_code none;
        if (m_state.start < 0 || !fs::exists(place.getTemporary(), none) || countBytes(place) == 0) throw;
        place.keep();
        throw std::runtime_error(
            isOver ? tr("host.Record.wholeIn", "%REASON%; the recording is in %FILE%",
                        {{"%REASON%", failure.what()}, {"%FILE%", place.getTemporary().string()}})
                   : tr("host.Record.partIn", "%REASON%; the part recorded so far is in %FILE%",
                        {{"%REASON%", failure.what()}, {"%FILE%", place.getTemporary().string()}}));
    }
}

// The line already names the file before the reason.
std::string toReason(const std::string& message, const fs::path& output) {
    const std::string name = output.string() + " ";
    return message.starts_with(name) ? asReason(message.substr(name.size()), output) : message;
}

} // namespace

int record(CLibrary& library, const SRecordOptions& options) {
    requireEffect(options, options.output);
    const CHandle device = openInDevice(options.device);
    CLiveLine line(options.show, "output");
    line.start(options.output, nlohmann::json::object());
    try {
        CRecorder(library, options, line).run(device);
        return kExitSuccess;
    } catch (const std::exception& failure) {
        line.fail(toReason(failure.what(), options.output));
        return kExitFailure;
    }
}

} // namespace host
