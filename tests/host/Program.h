// Runs the program under test in a temporary folder.
#pragma once

#include "host/Wav.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include <chrono>
#include <iterator>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace tests {

constexpr const char* kProgram = TONEWRIGHT_PROGRAM;
// Exit code for errors found by a sanitizer, different from the program's own exit codes.
constexpr int kSanitizerExit = 99;

inline std::vector<std::pair<std::string, std::string>> programEnvironment() {
    std::vector<std::pair<std::string, std::string>> environment{{"LC_ALL", "C.UTF-8"}};
    for (const char* name : {"ASAN_OPTIONS", "UBSAN_OPTIONS", "TSAN_OPTIONS"}) {
        const char* old = std::getenv(name);
        environment.emplace_back(name, (old ? std::string(old) + ":" : std::string()) +
                                           "exitcode=" + std::to_string(kSanitizerExit));
    }
    return environment;
}

// The arguments of a command without blanks in them.
inline std::vector<std::string> words(const std::string& command) {
    std::istringstream in(command);
    return {std::istream_iterator<std::string>(in), {}};
}
// The same of several commands, each behind a semicolon.
inline std::vector<std::vector<std::string>> commands(const std::string& text) {
    std::vector<std::vector<std::string>> all;
    std::istringstream in(text);
    for (std::string each; std::getline(in, each, ';');) all.push_back(words(each));
    return all;
}
// A command with further arguments.
inline std::vector<std::string> with(std::vector<std::string> command, const std::vector<std::string>& more) {
    command.insert(command.end(), more.begin(), more.end());
    return command;
}

// Whether the text has that part; both are printed otherwise.
inline testing::AssertionResult has(const std::string& text, const std::string& part) {
    return (text.find(part) == std::string::npos ? testing::AssertionFailure() : testing::AssertionSuccess())
           << "\"" << part << "\" in: " << text;
}

// A command that obeys the modes of files, as no command of root's does.
inline std::vector<std::string> withoutPrivileges(std::vector<std::string> command) {
    if (::geteuid() == 0)
        command.insert(command.begin(), {"setpriv", "--bounding-set", "-dac_override,-dac_read_search"});
    return command;
}

// False if the condition is not met within a minute.
template <class Condition> bool waitUntil(Condition condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(60);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}
// The same for that many lines of output.
inline bool waitForLines(const CProcess& process, std::ptrdiff_t lines) {
    return waitUntil([&] { return std::ranges::count(process.readOut(), '\n') >= lines; });
}

class CProgramTest : public testing::Test {
protected:
    // Killed after a minute, with exit code 137; no test takes that long.
    SProcessResult tonewright(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"timeout", "-s", "KILL", "60", kProgram});
        SProcessResult result = run(arguments, folder.path(), programEnvironment());
        EXPECT_LE(result.exitCode, 4) << "killed or crashed: " << result.err;
        return result;
    }
    // A run that must succeed without messages; returns standard output.
    std::string succeed(const std::vector<std::string>& arguments) {
        const SProcessResult result = tonewright(arguments);
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_EQ(result.err, "");
        return result.out;
    }
    // A run that must fail with messages in the usual form; returns standard error.
    std::string fail(const std::vector<std::string>& arguments) {
        const SProcessResult result = tonewright(arguments);
        EXPECT_EQ(result.exitCode, 1) << result.out << result.err;
        EXPECT_EQ(result.err.substr(0, 12), "tonewright: ");
        for (const char* hidden : {".part", "file://", "  "})
            EXPECT_EQ(result.err.find(hidden), std::string::npos) << result.err;
        return result.err;
    }
    // Runs another program, which must succeed; returns its output.
    std::string peer(const std::vector<std::string>& command) {
        const SProcessResult result = run(command, folder.path());
        EXPECT_EQ(result.exitCode, 0) << command[0] << ": " << result.out << result.err;
        return result.out;
    }

    // The samples of a file, decoded by another program.
    std::string decode(const std::string& name) {
        return peer({"sox", name, "-t", "raw", "-e", "signed", "-b", "16", "-L", "-"});
    }
    // "mp3,44100,2", as another program sees it.
    std::string probe(const std::string& name) {
        const std::string line = peer({"ffprobe", "-v", "error", "-show_entries",
                                       "stream=codec_name,sample_rate,channels", "-of", "csv=p=0", name});
        return line.substr(0, line.find('\n'));
    }

    void write(const std::string& name, const SSound& sound) { folder.write(name, toWav(sound)); }
    SSound readWav(const std::string& name) { return parseWav(readFile(folder / name)); }
    // Relative names of everything below the folder; those of folders end in a slash.
    std::set<std::string> list() {
        std::set<std::string> names;
        for (const auto& entry : std::filesystem::recursive_directory_iterator(folder.path()))
            names.insert(entry.path().lexically_relative(folder.path()).string() +
                         (entry.is_directory() && !entry.is_symlink() ? "/" : ""));
        return names;
    }

    CTempFolder folder;
};

inline std::vector<nlohmann::json> parseLines(const std::string& text) {
    std::vector<nlohmann::json> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) lines.push_back(nlohmann::json::parse(line));
    return lines;
}

} // namespace tests
