#include "terminal/Progress.h"

#include "base/Text.h"
#include "base/Translation.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <string_view>
#include <sys/ioctl.h>
#include <unistd.h>

namespace host {

namespace {

constexpr auto kRedraw = std::chrono::milliseconds(100);
constexpr auto kPlainLine = std::chrono::seconds(5);
constexpr size_t kDefaultColumns = 80, kDefaultRows = 24;

size_t getTerminalRows() {
    winsize size = {};
    const bool isKnown = ::ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_row > 0;
    return isKnown ? size.ws_row : kDefaultRows;
}

bool canMoveCursor() {
    const char* terminal = std::getenv("TERM");
    return ::isatty(STDERR_FILENO) && !(terminal && std::string_view(terminal) == "dumb");
}

std::string name(const std::filesystem::path& path) {
    return toPrintable(path.native());
}

} // namespace

size_t getTerminalColumns() {
    winsize size = {};
    const bool isKnown = ::ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
    return isKnown ? std::max<size_t>(size.ws_col, 2) : kDefaultColumns;
}

std::string toLine(const nlohmann::json& value) {
    return value.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

CProgress::CProgress(EOutput output, std::FILE* results)
    : m_output(output), m_results(results), m_bars(output == EOutput::normal && canMoveCursor()) {}

CProgress::~CProgress() {
    eraseBars();
}

CProgress::Job CProgress::start(const std::filesystem::path& input,
                                const std::optional<std::filesystem::path>& output,
                                const nlohmann::json& details) {
    std::lock_guard lock(m_mutex);
    const auto now = Clock::now();
    m_jobs.push_back({input, output, 0, now, now});
    emit(m_jobs.size() - 1, "start", details);
    return m_jobs.size() - 1;
}

void CProgress::advance(Job job, double fraction) {
    std::lock_guard lock(m_mutex);
    SJob& entry = m_jobs[job];
    entry.fraction = fraction;
    entry.running = true;
    const auto now = Clock::now();
    if (m_bars) {
        if (now - m_lastDrawn < kRedraw) return;
        m_lastDrawn = now;
        eraseBars();
        drawBars();
    } else if (m_output == EOutput::json) {
        if (now - entry.told < kRedraw) return;
        entry.told = now;
        emit(job, "progress", {{"fraction", fraction}});
    } else if (m_output == EOutput::normal && m_results && now - entry.told >= kPlainLine) {
        entry.told = now;
        std::fprintf(m_results, "%s: %.0f %%\n", name(entry.input).c_str(), fraction * 100);
        flushEvents();
    }
}

void CProgress::finish(Job job, const SJobResult& result) {
    std::string file;
    {
        std::lock_guard lock(m_mutex);
        file = nameOutput(job);
    }
    nlohmann::json details{{"codec", result.codec},
                           {"duration", result.duration},
                           {"seconds", result.elapsed},
                           {"bytes", result.bytes}};
    if (result.gain) details["gain"] = *result.gain;
    char speed[32], gain[32];
    std::snprintf(speed, sizeof speed, "%.0f", result.duration / std::max(result.elapsed, 1e-6));
    std::snprintf(gain, sizeof gain, "%+.1f", result.gain.value_or(0.0));
    const std::initializer_list<STextValue> values{{"%FILE%", file},
                                                   {"%CODEC%", result.codec},
                                                   {"%DURATION%", formatDuration(result.duration)},
                                                   {"%SIZE%", formatSize(result.bytes)},
                                                   {"%GAIN%", gain},
                                                   {"%SPEED%", speed}};
    finish(job,
           result.gain ? tr("host.Progress.doneWithGain",
                            "%FILE%: %CODEC%, %DURATION%, %SIZE%, %GAIN% dB, %SPEED% times real time", values)
                       : tr("host.Progress.done",
                            "%FILE%: %CODEC%, %DURATION%, %SIZE%, %SPEED% times real time", values),
           details);
}

void CProgress::finish(Job job, const std::string& line, const nlohmann::json& details) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    emit(job, "done", details);
    say(line);
    drawBars();
}

void CProgress::finishWith(Job job, const nlohmann::json& details) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    emit(job, "done", details);
    drawBars();
}

void CProgress::pause(Job job) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    drawBars();
}

void CProgress::announce(const char* event, nlohmann::json details) {
    std::lock_guard lock(m_mutex);
    if (m_output != EOutput::json) return;
    details["event"] = event;
    std::printf("%s\n", toLine(details).c_str());
    flushEvents();
}

void CProgress::print(const std::string& line) {
    std::lock_guard lock(m_mutex);
    if (m_output == EOutput::json) return;
    eraseBars();
    std::printf("%s\n", line.c_str());
    flushEvents();
    drawBars();
}

void CProgress::warn(Job job, const std::string& reason) {
    std::lock_guard lock(m_mutex);
    tell(job, "warning", reason);
}

void CProgress::fail(Job job, const std::string& reason) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    tell(job, "error", reason);
}

void CProgress::tell(Job job, const char* event, const std::string& reason) {
    eraseBars();
    emit(job, event, {{"message", reason}});
    if (m_output != EOutput::json)
        std::fprintf(stderr, "tonewright: %s: %s\n", name(m_jobs[job].input).c_str(),
                     toPrintable(reason).c_str());
    drawBars();
}

void CProgress::cancel(Job job) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    emit(job, "cancelled", nlohmann::json::object());
    drawBars();
}

void CProgress::skip(Job job) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    emit(job, "skipped", nlohmann::json::object());
    say(tr("host.Progress.skipped", "%FILE%: skipped, it exists", {{"%FILE%", nameOutput(job)}}));
    drawBars();
}

void CProgress::plan(Job job, bool replaces) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    emit(job, "planned", {{"replaces", replaces}});
    say(name(m_jobs[job].input) + " -> " + nameOutput(job) +
        (replaces ? " " + tr("host.Progress.replaced", "(replaced)") : ""));
}

std::string CProgress::nameOutput(Job job) const {
    return name(m_jobs[job].output.value_or(""));
}

void CProgress::say(const std::string& line) {
    if (m_output != EOutput::normal || !m_results) return;
    std::fprintf(m_results, "%s\n", line.c_str());
    flushEvents();
}

void CProgress::emit(Job job, const char* event, nlohmann::json details) {
    if (m_output != EOutput::json) return;
    details["event"] = event;
    details["input"] = m_jobs[job].input.native();
    if (m_jobs[job].output) details["output"] = m_jobs[job].output->native();
    std::printf("%s\n", toLine(details).c_str());
    flushEvents();
}

// If the window became narrower since, the terminal has broken the lines into several.
void CProgress::eraseBars() {
    const size_t columns = getTerminalColumns();
    for (; !m_drawn.empty(); m_drawn.pop_back())
        for (size_t rows = std::max<size_t>((m_drawn.back() + columns - 1) / columns, 1); rows > 0; --rows)
            std::fputs("\x1b[1A\x1b[2K", stderr);
    std::fflush(stderr);
}

// More bars than rows would scroll, and could not be erased.
void CProgress::drawBars() {
    if (!m_bars) return;
    const size_t columns = getTerminalColumns(), most = std::max<size_t>(getTerminalRows(), 2) - 1;
    for (const SJob& job : m_jobs) {
        if (!job.running || m_drawn.size() >= most) continue;
        // Some terminals begin a new line once the last column is filled.
        const std::string bar = drawBar(job, columns - 1);
        std::fprintf(stderr, "%s\n", bar.c_str());
        m_drawn.push_back(countColumns(bar));
    }
    std::fflush(stderr);
}

// A narrow terminal loses the time left first, then the bar, and then most of the name.
std::string CProgress::drawBar(const SJob& job, size_t width) const {
    constexpr size_t kName = 24, kPercent = 5, kTime = 12, kLeastBar = 10, kMostBar = 50;
    char percent[16];
    std::snprintf(percent, sizeof percent, "%3.0f %%", job.fraction * 100);
    const std::string file = name(job.input.filename());
    if (width < kPercent + 3)
        return fitColumns(std::to_string(static_cast<int>(job.fraction * 100)) + "%", width);

    // Two columns for the brackets and one between each two parts
    const size_t nameColumns = std::min(kName, std::max<size_t>(width / 3, 8));
    const size_t fixed = nameColumns + 1 + 2 + 1 + kPercent;
    if (width < fixed + kLeastBar) return fitColumns(file, width - kPercent - 1) + " " + percent;
    const bool hasTime = width >= fixed + kLeastBar + kTime;
    const size_t cells = std::min(width - fixed - (hasTime ? kTime : 0), kMostBar);
    const size_t filled = std::min(static_cast<size_t>(job.fraction * static_cast<double>(cells)), cells);
    std::string left;
    if (hasTime) {
        const double elapsed = std::chrono::duration<double>(Clock::now() - job.started).count();
        left = "  --:--";
        if (job.fraction > 0.02) left = "  " + formatDuration(elapsed * (1 - job.fraction) / job.fraction);
    }
    return fitColumns(file, nameColumns) + " [" + std::string(filled, '#') +
           std::string(cells - filled, '.') + "] " + percent + left;
}

} // namespace host
