#include "Cancel.h"
#include "Commands.h"
#include "Devices.h"
#include "EncodeJob.h"
#include "ExitCodes.h"
#include "Failure.h"
#include "Keyboard.h"
#include "LiveLine.h"
#include "OutputPlace.h"
#include "SoundFile.h"
#include "Text.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <stdexcept>
#include <thread>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int kPollMilliseconds = 50;
constexpr const char* kTemporaryEnding = ".part";

// Between the device's thread and the one that watches. The callbacks have no word of their own for the
// caller; there is one recording at a time.
struct STold {
    std::atomic<double> start{-1}; // the device's time of the first block; below 0: there was none
    std::atomic<double> position{0};
    std::atomic<double> left{0}; // greatest level since it was last taken
    std::atomic<double> right{0};
    std::atomic<bool> isStopped{false};
    double limit = 0; // seconds; 0: none
};
STold g_told;

// The device's time runs from its start on, and the first block comes later: counted is what was recorded.
bool onRecorded(double time) {
    if (g_told.start < 0) g_told.start = time;
    const double position = time - g_told.start;
    g_told.position = position;
    return !g_told.isStopped && (g_told.limit <= 0 || position < g_told.limit);
}

void onVolume(double left, double right) {
    // This thread alone raises them, so that a level taken in between is lost at worst.
    g_told.left = std::max<double>(g_told.left, left);
    g_told.right = std::max<double>(g_told.right, right);
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
    // Throws std::runtime_error when the file must not be written.
    CRecorder(CLibrary& library, const SRecordOptions& options, CLiveLine& line)
        : m_library(library),
          m_options(options), m_samples{options.rate.value_or(44100), options.channels.value_or(2),
                                        options.bits.value_or(16) / 8},
          m_place(options.output, kTemporaryEnding, options.force), m_line(line) {
        const std::string ending = kTemporaryEnding;
        m_library.SetTempExtension(std::u16string(ending.begin(), ending.end()).c_str());
    }

    // Returns when it was stopped. Throws std::runtime_error for any other end; what was recorded until then
    // stays.
    void run(const CHandle& device);

private:
    CHandle openSource(const CHandle& device);
    void encode(const CHandle& device);
    void watch(const std::atomic<bool>& hasEnded);
    uint64_t countBytes() const {
        std::error_code none;
        const uintmax_t bytes = fs::file_size(m_place.getTemporary(), none);
        return none ? 0 : bytes;
    }

    CLibrary& m_library;
    const SRecordOptions& m_options;
    const SSampleFormat m_samples;
    COutputPlace m_place;
    CLiveLine& m_line;
};

CHandle CRecorder::openSource(const CHandle& device) {
    clearFailure();
    CHandle source(m_library.CreateAudioSoureFromAudioInDevice(device.get(), m_samples.rate,
                                                               m_samples.channels, m_samples.bytesPerSample));
    if (source) {
        m_library.AudioSource_SetRecordingCallback(source.get(), onRecorded);
        m_library.AudioSource_SetRecordingVolumeCallback(source.get(), onVolume);
        if (m_library.AudioSource_Open(source.get()) == TONEWRIGHT_OK) return source;
    }
    const std::string reason = takeFailure("");
    throw std::runtime_error("The sound device cannot record " + describe(m_samples) +
                             (reason.empty() ? "" : ": " + reason));
}

// Shows and obeys until the recording has ended.
void CRecorder::watch(const std::atomic<bool>& hasEnded) {
    CKeyboard keyboard;
    while (!hasEnded) {
        const char key = keyboard.wait(kPollMilliseconds);
        if (key == 'q' || key == 'Q' || isCancelled()) g_told.isStopped = true;
        if (!m_line.isDue()) continue;
        const double position = g_told.position, left = g_told.left.exchange(0),
                     right = g_told.right.exchange(0);
        const uint64_t bytes = countBytes();
        const std::string at = formatDuration(position) + ", " + formatSize(bytes);
        m_line.update(drawMeter(left) + " " + drawMeter(right) + "  " + at, at,
                      {{"position", position}, {"left", left}, {"right", right}, {"bytes", bytes}});
    }
}

// Returns when the device delivers no more and all that it delivered is in the file.
void CRecorder::encode(const CHandle& device) {
    const CHandle format =
        requireFormat(m_library, m_place.getTemporary(), m_samples, m_options, m_options.output, "It");
    const CHandle source = openSource(device);
    const CHandle encoder(m_library.CreateAudioEncoder(source.get(), format.get()));
    int32_t result = TONEWRIGHT_ENCODER_FAILED;
    std::string reason;
    std::atomic<bool> hasEnded{false};
    std::thread thread([&] {
        clearFailure();
        result = m_library.AudioEncoder_Encode(encoder.get());
        reason = takeFailure("The recording failed");
        hasEnded = true;
    });
    watch(hasEnded);
    thread.join();
    if (result == TONEWRIGHT_OK) return;
    throw std::runtime_error(asReason(reason, m_place.getTemporary()));
}

void CRecorder::run(const CHandle& device) {
    g_told.limit = m_options.seconds;
    try {
        encode(device);
    } catch (const std::runtime_error& failure) {
        // Nobody can make the same sound again.
        if (g_told.start < 0 || countBytes() == 0) throw;
        m_place.keep();
        throw std::runtime_error(std::string(failure.what()) + "; what was recorded is in " +
                                 m_place.getTemporary().string());
    }
    const double position = g_told.position;
    const bool wasWanted = g_told.isStopped || (g_told.limit > 0 && position >= g_told.limit);
    if (!wasWanted && g_told.start < 0) throw std::runtime_error("The sound device delivers nothing");
    const uint64_t bytes = countBytes();
    m_place.commit();
    if (!wasWanted)
        throw std::runtime_error("The sound device stopped; what was recorded until then, " +
                                 formatDuration(position) + ", is there");
    const std::string codec = codecName(m_options.output);
    m_line.finish(codec + ", " + formatDuration(position) + ", " + formatSize(bytes),
                  {{"codec", codec}, {"duration", position}, {"bytes", bytes}});
}

// The file is named before the reason already.
std::string toReason(const std::string& message, const fs::path& output) {
    const std::string name = output.string() + " ";
    return message.starts_with(name) ? asReason(message.substr(name.size()), output) : message;
}

} // namespace

int record(CLibrary& library, const SRecordOptions& options) {
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
