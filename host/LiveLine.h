// What a user sees of sound that is played or recorded.
#pragma once

#include "Progress.h"

#include <chrono>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>

namespace host {

// One file at a time; one thread. On a terminal its state is a line of standard error that is drawn anew,
// elsewhere a line of standard output now and then; results go to standard output, failures to standard
// error. With JSON everything is events on standard output.
class CLiveLine {
public:
    // The key is what events call the file.
    CLiveLine(EOutput output, const char* key);
    ~CLiveLine() { erase(); }
    CLiveLine(const CLiveLine&) = delete;
    CLiveLine& operator=(const CLiveLine&) = delete;

    // The details are those of the event, here and below.
    void start(const std::filesystem::path& file, const nlohmann::json& details);
    bool isDue() const; // whether the next update would show
    // `live` is what the terminal's line says behind the name, `plain` what the plain one does.
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
