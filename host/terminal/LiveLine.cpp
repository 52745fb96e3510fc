#include "terminal/LiveLine.h"

#include "base/Text.h"

#include <algorithm>
#include <cstdio>
#include <unistd.h>

namespace host {

namespace {

constexpr auto kRedraw = std::chrono::milliseconds(100);
constexpr auto kPlainLine = std::chrono::seconds(5);
constexpr size_t kName = 24; // columns

} // namespace

CLiveLine::CLiveLine(EOutput output, const char* key)
    : m_output(output), m_key(key), m_live(output == EOutput::normal && ::isatty(STDERR_FILENO)),
      m_interval(m_live || output == EOutput::json ? Clock::duration(kRedraw) : Clock::duration(kPlainLine)) {
}

void CLiveLine::start(const std::filesystem::path& file, const nlohmann::json& details) {
    m_file = file;
    m_due = Clock::now() + (m_live ? Clock::duration::zero() : m_interval);
    emit("start", details);
}

bool CLiveLine::isDue() const {
    return m_output != EOutput::quiet && Clock::now() >= m_due;
}

void CLiveLine::update(const std::string& live, const std::string& plain, const nlohmann::json& details) {
    if (!isDue()) return;
    // Updates that were missed are not made up for.
    m_due = std::max(m_due + m_interval, Clock::now() + m_interval / 2);
    emit("progress", details);
    if (m_live) {
        const size_t columns = getTerminalColumns();
        const std::string line =
            fitColumns(toPrintable(m_file.filename().native()), std::min(kName, columns / 2)) + "  " + live;
        // The last column stays empty: some terminals would wrap to the next line.
        std::fprintf(stderr, "\r%s\x1b[K", fitColumns(line, columns - 1).c_str());
        std::fflush(stderr);
        m_drawn = true;
    } else {
        say(plain);
    }
}

void CLiveLine::finish(const std::string& plain, const nlohmann::json& details) {
    erase();
    emit("done", details);
    say(plain);
}

void CLiveLine::fail(const std::string& reason, const nlohmann::json& details) {
    erase();
    nlohmann::json all = details;
    all["message"] = reason;
    emit("error", all);
    if (m_output != EOutput::json)
        std::fprintf(stderr, "tonewright: %s: %s\n", toPrintable(m_file.native()).c_str(),
                     toPrintable(reason).c_str());
}

void CLiveLine::cancel(const nlohmann::json& details) {
    erase();
    emit("cancelled", details);
}

void CLiveLine::emit(const char* event, nlohmann::json details) {
    if (m_output != EOutput::json) return;
    details["event"] = event;
    details[m_key] = m_file.native();
    std::printf("%s\n", toLine(details).c_str());
    flushEvents();
}

void CLiveLine::say(const std::string& plain) {
    if (m_output != EOutput::normal) return;
    std::printf("%s: %s\n", toPrintable(m_file.native()).c_str(), plain.c_str());
    flushEvents();
}

void CLiveLine::erase() {
    if (!m_drawn) return;
    std::fputs("\r\x1b[K", stderr);
    std::fflush(stderr);
    m_drawn = false;
}

} // namespace host
