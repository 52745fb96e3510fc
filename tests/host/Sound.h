// The program under test with a sound card.
#pragma once

#include "host/Program.h"
#include "host/Terminal.h"
#include "support/SoundServer.h"

#include <chrono>
#include <memory>
#include <string>
#include <thread>

namespace tests {

// Removes silent frames, which the noise does not contain: while other tests run, the sound server may have
// to wait for a processor and then plays a gap of its own.
inline std::string withoutGaps(const std::string& heard) {
    std::string sound;
    for (size_t at = 0; at + 4 <= heard.size(); at += 4)
        if (heard.compare(at, 4, std::string(4, '\0')) != 0) sound.append(heard, at, 4);
    return sound;
}

class CSoundTest : public CProgramTest {
protected:
    using Clock = std::chrono::steady_clock;

    explicit CSoundTest(EMicrophone microphone) : server(microphone) {}

    // Starts the program with its events in a file and its keys on a terminal.
    std::unique_ptr<CTerminal> start(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), kProgram);
        arguments.push_back("--json");
        return std::make_unique<CTerminal>(arguments, CTerminal::EOutput::file, folder.path(),
                                           programEnvironment());
    }
    static std::vector<nlohmann::json> eventsOf(const std::string& text) {
        return parseLines(text.substr(0, text.rfind('\n') + 1)); // the last line may be incomplete
    }
    // Waits for the first event that meets the condition; null if the program ends before.
    template <class Condition> static nlohmann::json waitFor(CProcess& process, Condition serves) {
        for (bool running = true; running;) {
            running = process.isRunning();
            for (const nlohmann::json& event : eventsOf(process.readOut()))
                if (serves(event)) return event;
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        ADD_FAILURE() << "the program ended before: " << process.readOut();
        return nullptr;
    }
    static nlohmann::json waitForPosition(CProcess& process, double seconds) {
        return waitFor(process, [&](const auto& event) {
            return event["event"] == "progress" && event["position"] >= seconds;
        });
    }
    static double since(Clock::time_point start) {
        return std::chrono::duration<double>(Clock::now() - start).count();
    }
    // Noise without zero samples, so that it differs from silence.
    static SSound makeLoudNoise(double seconds) {
        SSound sound =
            makeNoise(CSoundServer::kRate, 2, 16, static_cast<size_t>(seconds * CSoundServer::kRate));
        for (size_t i = 0; i < sound.samples.size(); i += 2) sound.samples[i] |= 1;
        return sound;
    }
    // Removes the silence at both ends.
    static std::string trim(const std::string& samples) {
        const size_t first = samples.find_first_not_of('\0');
        if (first == std::string::npos) return {};
        const size_t start = first / CSoundServer::kFrameBytes * CSoundServer::kFrameBytes;
        const size_t end = samples.find_last_not_of('\0') / CSoundServer::kFrameBytes + 1;
        return samples.substr(start, end * CSoundServer::kFrameBytes - start);
    }

    CSoundServer server;
};

} // namespace tests
