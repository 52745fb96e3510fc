// Sound devices that follow a test's script and record what is done to them.
#pragma once

#include "peru/collections/Enums.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstring>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace tests {

using peru::P;
using peru::media::CAudioFormat;

// Base of both directions. By default a device supports every format.
template <class Interface> class TScriptedDevice : public peru::CObject, public Interface {
public:
    std::function<P<CAudioFormat>(int32_t rate, int32_t bytes, int32_t channels)> takes =
        [](int32_t rate, int32_t bytes, int32_t channels) {
            return peru::make<CAudioFormat>(rate, channels, bytes * 8);
        };
    P<CAudioFormat> format; // of the last open
    std::string name = "scripted";
    std::atomic<int> opens{0};
    std::atomic<int> overlaps{0}; // concurrent calls where only one at a time is allowed

    P<peru::IString> getId() const override { return peru::CString::fromUTF8("7"); }
    P<peru::IString> getName() const override { return peru::CString::fromUTF8(name); }
    P<peru::IString> getListName() const override { return getName(); }
    P<peru::IString> getHostApi() const override { return getName(); }
    bool isDefault() const override { return true; }
    int32_t getMaxChannelCount() const override { return 2; }
    P<CAudioFormat> getFormat(int32_t rate, int32_t bytes, int32_t channels) override {
        return takes(rate, bytes, channels);
    }
    bool isOpened() const override { return m_opened; }
    int32_t getStatus() const override { return m_running ? 1 : 0; }
    double getGain() const override { return m_gain; }
    void setGain(double gain) override { m_gain = gain; }

protected:
    // Held during operations that must not run concurrently.
    class CAlone {
    public:
        explicit CAlone(TScriptedDevice& device) : m_device(device) {
            if (m_device.m_inside++ > 0) ++m_device.overlaps;
        }
        ~CAlone() { --m_device.m_inside; }
        CAlone(const CAlone&) = delete;
        CAlone& operator=(const CAlone&) = delete;

    private:
        TScriptedDevice& m_device;
    };

    void requireOpened() const {
        if (!m_opened) throw peru::media::CMediaException("the device is not open");
    }
    void openWith(const P<CAudioFormat>& wanted) {
        if (wanted->getBitsPerSample() > 24) throw peru::media::CMediaException("32 Bits are not supported");
        ++opens;
        format = wanted;
        m_opened = true;
    }

    std::atomic<bool> m_opened{false};
    std::atomic<bool> m_running{false};
    std::atomic<int> m_inside{0};
    std::atomic<double> m_gain{1.0};
};

// Discards the sound, `speed` times faster than real time.
class CScriptedOutDevice : public TScriptedDevice<peru::media::IAudioOutDevice> {
public:
    explicit CScriptedOutDevice(double speed = 200.0) : m_speed(speed) {}

    std::atomic<int> starts{0};
    std::atomic<int> stops{0};

    // Everything written since the last open.
    std::string written() const {
        std::scoped_lock lock(m_mutex);
        return m_written;
    }
    // The device disappears.
    void remove() {
        m_isGone = true;
        m_running = false;
    }

    void open(const P<CAudioFormat>& wanted, const P<peru::IInStream>&) override {
        CAlone alone(*this);
        if (m_opened) return;
        openWith(wanted);
        std::scoped_lock lock(m_mutex);
        m_written.clear();
        m_heard = m_end = 0.0;
    }
    void close() override {
        CAlone alone(*this);
        m_opened = m_running = false;
    }
    void start() override {
        CAlone alone(*this);
        requireOpened();
        std::scoped_lock lock(m_mutex);
        advance();
        ++starts;
        m_running = !m_isGone;
    }
    void pause() override {
        CAlone alone(*this);
        std::scoped_lock lock(m_mutex);
        advance();
        m_running = false;
    }
    void stop() override {
        CAlone alone(*this);
        std::scoped_lock lock(m_mutex);
        advance();
        ++stops;
        m_running = false;
        m_end = m_heard;
    }
    void write(const void* data, int64_t size) override {
        requireOpened();
        requireThere();
        std::scoped_lock lock(m_mutex);
        advance();
        m_written.append(static_cast<const char*>(data), static_cast<size_t>(size));
        m_end += static_cast<double>(size);
    }
    int64_t getQueuedSize() const override {
        std::scoped_lock lock(m_mutex);
        advance();
        return static_cast<int64_t>(m_end - m_heard);
    }
    double getPosition() const override {
        requireThere();
        std::scoped_lock lock(m_mutex);
        advance();
        return m_opened ? m_heard / getBytesPerSecond() : 0.0;
    }

private:
    using Clock = std::chrono::steady_clock;

    void requireThere() const {
        if (m_isGone) throw peru::media::CMediaException("the device has gone");
    }
    double getBytesPerSecond() const {
        return static_cast<double>(format->getSampleRate()) * format->getBytesPerFrame();
    }
    void advance() const {
        const Clock::time_point now = Clock::now();
        if (m_running)
            m_heard = std::min(m_end, m_heard + std::chrono::duration<double>(now - m_then).count() *
                                                    m_speed * getBytesPerSecond());
        m_then = now;
    }

    const double m_speed;
    std::atomic<bool> m_isGone{false};
    mutable std::mutex m_mutex; // guards the members below
    std::string m_written;
    double m_end = 0.0; // bytes, as is the next
    mutable double m_heard = 0.0;
    mutable Clock::time_point m_then = Clock::now();
};

// Delivers data passed to deliver(), on the calling thread, or returned by `next`, on its own thread. Like a
// real device it waits in close() and removeListener() for calls in progress.
class CScriptedInDevice : public TScriptedDevice<peru::media::IAudioInDevice> {
public:
    ~CScriptedInDevice() override { join(); }

    std::function<std::string()> next; // an empty text ends the stream

    size_t getListenerCount() {
        std::scoped_lock lock(m_calls);
        return m_listeners.size();
    }
    // Returns the listeners' result. A device that is not running delivers nothing.
    bool deliver(const std::string& bytes, double left = 0.25, double right = 0.5) {
        std::scoped_lock lock(m_calls);
        if (!m_running) return false;
        m_frames += static_cast<int64_t>(bytes.size()) / format->getBytesPerFrame();
        for (peru::media::IAudioInDeviceListener* listener : m_listeners)
            if (!listener->onAudioData(bytes.data(), static_cast<int64_t>(bytes.size()))) m_running = false;
        for (peru::media::IAudioInDeviceListener* listener : m_listeners)
            listener->onVolume(peru::make<peru::media::CVolumeInfo>(left, right));
        return m_running;
    }
    void endStream() { m_running = false; }

    void setFormat(const P<CAudioFormat>& wanted) override { m_default = wanted; }
    void open(const P<CAudioFormat>& wanted) override {
        CAlone alone(*this);
        if (!m_opened) openWith(wanted ? wanted : m_default);
    }
    void start() override {
        CAlone alone(*this);
        requireOpened();
        m_frames = 0;
        m_running = true;
        if (!next) return;
        join();
        m_thread = std::thread([this] {
            while (m_running) {
                const std::string block = next();
                if (block.empty() || !deliver(block)) m_running = false;
            }
        });
    }
    void stop() override { close(); }
    void close() override {
        CAlone alone(*this);
        m_opened = m_running = false;
        join();
        std::scoped_lock lock(m_calls);
    }
    double getPosition() const override { return static_cast<double>(m_frames) / format->getSampleRate(); }
    void addListener(peru::media::IAudioInDeviceListener* listener) override {
        std::scoped_lock lock(m_calls);
        m_listeners.push_back(listener);
    }
    void removeListener(peru::media::IAudioInDeviceListener* listener) override {
        std::scoped_lock lock(m_calls);
        std::erase(m_listeners, listener);
    }

private:
    void join() {
        if (m_thread.joinable()) m_thread.join();
    }

    std::mutex m_calls; // held while listeners are called
    std::vector<peru::media::IAudioInDeviceListener*> m_listeners;
    P<CAudioFormat> m_default;
    std::atomic<int64_t> m_frames{0};
    std::thread m_thread;
};

// Replaces the machine's devices by one of each kind, either of which may be missing, until it is destroyed.
// Created and destroyed in order, by one thread.
class CScriptedSystem {
public:
    explicit CScriptedSystem(const P<CScriptedOutDevice>& out, const P<CScriptedInDevice>& in = nullptr) {
        s_current = peru::make<CSystem>(out, in);
        peru::media::setSystem(s_current);
    }
    ~CScriptedSystem() {
        s_current = m_before;
        peru::media::setSystem(s_current);
    }
    CScriptedSystem(const CScriptedSystem&) = delete;
    CScriptedSystem& operator=(const CScriptedSystem&) = delete;

private:
    class CSystem : public peru::CObject, public peru::media::ISystem {
    public:
        CSystem(const P<CScriptedOutDevice>& out, const P<CScriptedInDevice>& in) : m_out(out), m_in(in) {}
        peru::WEnum<peru::media::IAudioOutDevice> getOutDevices() override {
            return {peru::make<peru::CEmptyEnum>()};
        }
        peru::WEnum<peru::media::IAudioInDevice> getInDevices() override {
            return {peru::make<peru::CEmptyEnum>()};
        }
        P<peru::media::IAudioOutDevice> getDefaultOutDevice() override { return m_out; }
        P<peru::media::IAudioInDevice> getDefaultInDevice() override { return m_in; }

    private:
        P<CScriptedOutDevice> m_out;
        P<CScriptedInDevice> m_in;
    };

    static inline P<peru::media::ISystem> s_current;
    const P<peru::media::ISystem> m_before = s_current;
};

} // namespace tests
