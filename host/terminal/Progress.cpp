#include "terminal/Progress.h"

#include "base/Text.h"

#include <cstdio>
#include <sys/ioctl.h>
#include <unistd.h>

namespace host {

namespace {

constexpr auto kRedraw = std::chrono::milliseconds(100);
constexpr auto kPlainLine = std::chrono::seconds(5);
constexpr size_t kDefaultColumns = 80;

std::string name(const std::filesystem::path& path) {
    return toPrintable(path.native());
}

} // namespace

size_t getTerminalColumns() {
    winsize size = {};
    return ::ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0 ? size.ws_col : kDefaultColumns;
}

std::string toLine(const nlohmann::json& value) {
    return value.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

CProgress::CProgress(EOutput output)
    : m_output(output), m_bars(output == EOutput::normal && ::isatty(STDERR_FILENO)) {}

CProgress::~CProgress() {
    eraseBars();
}

CProgress::Job CProgress::start(const std::filesystem::path& input, const std::filesystem::path& output,
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
    } else if (m_output == EOutput::normal && now - entry.told >= kPlainLine) {
        entry.told = now;
        std::printf("%s: %.0f %%\n", name(entry.input).c_str(), fraction * 100);
        flushEvents();
    }
}

void CProgress::finish(Job job, const SJobResult& result) {
    std::lock_guard lock(m_mutex);
    m_jobs[job].running = false;
    eraseBars();
    emit(job, "done",
         {{"codec", result.codec},
          {"duration", result.duration},
          {"seconds", result.elapsed},
          {"bytes", result.bytes}});
    if (m_output == EOutput::normal) {
        std::printf("%s: %s, %s, %s, %.0f times real time\n", name(m_jobs[job].output).c_str(),
                    result.codec.c_str(), formatDuration(result.duration).c_str(),
                    formatSize(result.bytes).c_str(), result.duration / std::max(result.elapsed, 1e-6));
        flushEvents();
    }
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

void CProgress::emit(Job job, const char* event, nlohmann::json details) {
    if (m_output != EOutput::json) return;
    details["event"] = event;
    details["input"] = m_jobs[job].input.native();
    details["output"] = m_jobs[job].output.native();
    std::printf("%s\n", toLine(details).c_str());
    flushEvents();
}

void CProgress::eraseBars() {
    for (; m_drawn > 0; --m_drawn) std::fputs("\x1b[1A\x1b[2K", stderr);
    std::fflush(stderr);
}

void CProgress::drawBars() {
    if (!m_bars) return;
    const size_t columns = getTerminalColumns();
    for (const SJob& job : m_jobs) {
        if (!job.running) continue;
        std::fprintf(stderr, "%s\n", drawBar(job, columns).c_str());
        ++m_drawn;
    }
    std::fflush(stderr);
}

std::string CProgress::drawBar(const SJob& job, size_t width) const {
    constexpr size_t kName = 24, kFixed = kName + 18;
    const std::string file = fitColumns(name(job.input.filename()), kName);

    const size_t cells = width > kFixed + 10 ? std::min<size_t>(width - kFixed, 50) : 10;
    const size_t filled = static_cast<size_t>(job.fraction * static_cast<double>(cells));
    const double elapsed = std::chrono::duration<double>(Clock::now() - job.started).count();
    std::string left = "  --:--";
    if (job.fraction > 0.02) left = "  " + formatDuration(elapsed * (1 - job.fraction) / job.fraction);
    char percent[16];
    std::snprintf(percent, sizeof percent, "] %3.0f %%", job.fraction * 100);
    return file + " [" + std::string(std::min(filled, cells), '#') +
           std::string(cells - std::min(filled, cells), '.') + percent + left;
}

} // namespace host
