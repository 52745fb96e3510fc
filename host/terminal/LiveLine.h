// Shows the state of playback or of a recording.
#pragma once

#include "terminal/Progress.h"

#include <chrono>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>

namespace host {

// One file at a time; one thread. On a terminal the state is a line of standard error that is redrawn;
// otherwise it is printed to standard output from time to time. Results go to standard output, failures to
// standard error. With JSON everything is printed to standard output as events.
class CLiveLine {
public:
    // `key` is the name of the file's property in events.
    CLiveLine(EOutput output, const char* key);
    ~CLiveLine() { erase(); }
    CLiveLine(const CLiveLine&) = delete;
    CLiveLine& operator=(const CLiveLine&) = delete;

    // Here and below, `details` are additional properties of the event.
    void start(const std::filesystem::path& file, const nlohmann::json& details);
    bool isDue() const; // whether the next update would be shown
    // `live` is shown after the file's name on a terminal, `plain` otherwise.
    void update(const std::string& live, const std::string& plain, const nlohmann::json& details);
    void finish(const std::string& plain, const nlohmann::json& details);
    void fail(const std::string& reason, const nlohmann::json& details = nlohmann::json::object());
    void cancel(const nlohmann::json& details);

private:
    using Clock = std::chrono::steady_clock;

    void emit(const char* event, nlohmann::json details);
    void say(const std::string& plain);
    void erase();

    const EOutput m_output;
    const std::string m_key;
    const bool m_live;
    const Clock::duration m_interval;
    std::filesystem::path m_file;
    Clock::time_point m_due;
    bool m_drawn = false;
};

} // namespace host
