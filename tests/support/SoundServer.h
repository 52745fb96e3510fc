// A virtual sound card: a private PulseAudio daemon that the sound system finds through ALSA.
#pragma once

#include "support/Environment.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <chrono>
#include <cstring>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <sys/socket.h>
#include <sys/un.h>
#include <thread>
#include <vector>

namespace tests {

enum class EMicrophone {
    none,    // the input device hears what the output device plays
    isolated // it hears what play() plays, as does a second input device, "microphone"
};

// All sound is 44100 Hz, 2 channels, 16 bits and passes unchanged. During its lifetime this process and its
// children see a single device for output and input, "default". A process that has opened the sound system
// stays connected to that server, so each test needs its own process.
class CSoundServer {
public:
    static constexpr int kRate = 44100;
    static constexpr int kFrameBytes = 4;

    // Throws std::runtime_error with the daemon's output if it does not start.
    explicit CSoundServer(EMicrophone microphone = EMicrophone::none) {
        writeConfiguration(microphone == EMicrophone::isolated);
        const std::string home = m_folder.path(), runtime = m_folder / "run";
        m_daemon.emplace(std::vector<std::string>{"setpriv",
                                                  "--pdeathsig",
                                                  "KILL",
                                                  "env",
                                                  "-i",
                                                  "PATH=/usr/bin:/bin",
                                                  "HOME=" + home,
                                                  "XDG_RUNTIME_DIR=" + runtime,
                                                  "PULSE_RUNTIME_PATH=" + runtime,
                                                  "PULSE_STATE_PATH=" + runtime,
                                                  "pulseaudio",
                                                  "-n",
                                                  "-F",
                                                  m_folder / "fx.pa",
                                                  "--daemonize=no",
                                                  "--use-pid-file=no",
                                                  "--exit-idle-time=-1",
                                                  "--disable-shm=yes",
                                                  "--high-priority=no",
                                                  "--realtime=no",
                                                  "--log-target=stderr"});
        waitUntilReady();
    }
    ~CSoundServer() {
        if (!m_daemon) return;
        m_daemon->signal(SIGTERM);
        m_daemon->wait();
    }
    CSoundServer(const CSoundServer&) = delete;
    CSoundServer& operator=(const CSoundServer&) = delete;

    // Kills the daemon as in a crash; from then on there is no device.
    void kill() { m_daemon.reset(); }

    // Records the output device, silence included, from before this returns until it is destroyed. Its
    // readOut() returns the sound so far.
    std::unique_ptr<CProcess> listen() const {
        auto recorder = std::make_unique<CProcess>(
            std::vector<std::string>{"parec", "-d", "fx_out.monitor", "--raw", "--rate=44100", "--channels=2",
                                     "--format=s16le", "--latency-msec=20"});
        while (recorder->readOut().empty()) {
            if (!recorder->isRunning())
                throw std::runtime_error("nobody hears the output device: " + recorder->wait().err);
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        return recorder;
    }

    // Plays raw samples into the isolated microphone; its wait() returns when everything has been played.
    std::unique_ptr<CProcess> play(const std::string& samples) const {
        return std::make_unique<CProcess>(std::vector<std::string>{
            "pacat", "--playback", "-d", "fx_mic", "--raw", "--rate=44100", "--channels=2", "--format=s16le",
            m_folder.write("microphone.raw", samples)});
    }

private:
    void writeConfiguration(bool hasMicrophone) {
        std::filesystem::create_directory(m_folder / "run");
        std::filesystem::permissions(m_folder / "run", std::filesystem::perms::owner_all);
        // Without norewinds every new stream stalls for a second.
        const auto sink = [](const std::string& name) {
            return "load-module module-null-sink sink_name=" + name +
                   " rate=44100 channels=2 format=s16le norewinds=1\n";
        };
        m_folder.write("fx.pa", ".fail\n" + sink("fx_out") + (hasMicrophone ? sink("fx_mic") : "") +
                                    "set-default-sink fx_out\nset-default-source " +
                                    (hasMicrophone ? "fx_mic" : "fx_out") +
                                    ".monitor\n"
                                    "load-module module-native-protocol-unix socket=" +
                                    m_socket + " auth-anonymous=1 auth-cookie-enabled=0\n");
        const std::string server = " { type pulse server \"unix:" + m_socket + "\"";
        m_folder.write("asound.conf", "pcm.default" + server + " }\nctl.default" + server + " }\n" +
                                          (hasMicrophone ? "pcm.microphone { type asym capture.pcm" + server +
                                                               " device \"fx_mic.monitor\" } }\n"
                                                         : ""));
    }

    void waitUntilReady() {
        sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        if (m_socket.size() >= sizeof address.sun_path)
            throw std::runtime_error("the path of the sound server's socket is too long: " + m_socket);
        std::memcpy(address.sun_path, m_socket.c_str(), m_socket.size());
        const int handle = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        bool ready = false;
        while (!ready && m_daemon->isRunning() && std::chrono::steady_clock::now() < end) {
            ready = ::connect(handle, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
            if (!ready) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        ::close(handle);
        if (ready) return;
        m_daemon->signal(SIGKILL);
        throw std::runtime_error("the sound server does not start: " + m_daemon->wait().err);
    }

    CTempFolder m_folder;
    const std::string m_socket = m_folder / "s";
    CEnvironment m_alsa{"ALSA_CONFIG_PATH", m_folder / "asound.conf"};
    CEnvironment m_server{"PULSE_SERVER", "unix:" + m_socket};
    CEnvironment m_cookie{"PULSE_COOKIE", m_folder / "cookie"};
    CEnvironment m_runtime{"PULSE_RUNTIME_PATH", m_folder / "run"};
    CEnvironment m_jack{"JACK_NO_START_SERVER", "1"};
    std::optional<CProcess> m_daemon;
};

// Without silent frames: a busy machine may leave gaps.
inline std::string withoutSilence(const std::string& samples, size_t from = 0) {
    static const std::string kSilence(CSoundServer::kFrameBytes, '\0');
    std::string sound;
    for (size_t at = from; at + CSoundServer::kFrameBytes <= samples.size(); at += CSoundServer::kFrameBytes)
        if (samples.compare(at, CSoundServer::kFrameBytes, kSilence) != 0)
            sound.append(samples, at, CSoundServer::kFrameBytes);
    return sound;
}

} // namespace tests
