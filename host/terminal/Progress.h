// Shows the progress of jobs.
#pragma once

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <mutex>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <vector>

namespace host {

enum class EOutput {
    normal, // bars on a terminal, otherwise plain lines
    quiet,  // failures only
    json,   // one event per line on standard output
};

struct SJobResult {
    double duration = 0; // seconds of sound
    double elapsed = 0;  // seconds of processing
    uint64_t bytes = 0;
    std::string codec;
    std::optional<double> gain = {}; // decibels
};

// Thread-safe. Results go to standard output; bars, failures and warnings go to standard error. With JSON
// everything goes to standard output.
class CProgress {
public:
    // `results` receives what would otherwise go to standard output, except for JSON and print(). Null: it is
    // dropped.
    explicit CProgress(EOutput output, std::FILE* results = stdout);
    ~CProgress();

    using Job = size_t;
    Job start(const std::filesystem::path& input, const std::optional<std::filesystem::path>& output,
              const nlohmann::json& details);
    void advance(Job job, double fraction);
    void finish(Job job, const SJobResult& result);
    // The same for a job with another kind of result: a line for the user, and its parts for JSON.
    void finish(Job job, const std::string& line, const nlohmann::json& details);
    // Of a job whose result is not a file. The caller prints it.
    void finishWith(Job job, const nlohmann::json& details);
    // Hides the job's bar until the next progress.
    void pause(Job job);
    // An event that belongs to no job. For JSON only.
    void announce(const char* event, nlohmann::json details);
    // A line on standard output; not with JSON.
    void print(const std::string& line);
    // Reports a problem that does not end the job.
    void warn(Job job, const std::string& reason);
    void fail(Job job, const std::string& reason);
    void cancel(Job job);
    // The output exists and is left as it is.
    void skip(Job job);
    // Shows a job that is not run. `replaces`: the output exists.
    void plan(Job job, bool replaces);

private:
    using Clock = std::chrono::steady_clock;

    struct SJob {
        std::filesystem::path input;
        std::optional<std::filesystem::path> output;
        double fraction = 0;
        Clock::time_point started;
        Clock::time_point told;
        bool running = true;
    };

    std::string nameOutput(Job job) const;
    void say(const std::string& line);
    void tell(Job job, const char* event, const std::string& reason);
    void emit(Job job, const char* event, nlohmann::json details);
    void eraseBars();
    void drawBars();
    std::string drawBar(const SJob& job, size_t width) const;

    EOutput m_output;
    std::FILE* m_results;
    bool m_bars;
    std::mutex m_mutex; // guards the members below and both streams
    std::vector<SJob> m_jobs;
    std::vector<size_t> m_drawn; // the bars on the screen: columns of each line
    Clock::time_point m_lastDrawn;
};

size_t getTerminalColumns(); // of standard error; at least 2

// Serialises the value as one line. Bytes that are not valid UTF-8, as in file names, become U+FFFD.
std::string toLine(const nlohmann::json& value);

} // namespace host
