// Sources, formats and a plug-in with scripted behaviour.
#pragma once

#include "peru/uri/URI.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/plugins/ISonoraPlugin.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "support/MediaBase.h"

#include <algorithm>
#include <atomic>
#include <functional>
#include <initializer_list>

namespace tests {

struct SFakeSource {
    int rate = 1000;
    int channels = 2;
    int bytesPerSample = 2;
    int64_t frames = 1000;
    int chunkFrames = 300;
    std::function<void()> onOpen = [] {};  // may throw
    std::function<void()> onClose = [] {}; // may throw
    std::function<void()> onRead = [] {};  // may throw
    bool staysClosed = false;              // open() does not open
};

// 16-bit sample of channel c in frame f: (f * 4 + c) wrapped to 15 bits. Other widths are silent.
class CFakeSource : public CSourceBase {
public:
    explicit CFakeSource(SFakeSource script, P<peru::IURI> uri = nullptr)
        : m_script(std::move(script)), m_uri(std::move(uri)) {
        ++s_alive;
    }
    ~CFakeSource() override { --s_alive; }

    static inline std::atomic<int> s_alive{0};

    void open() override {
        ++opens;
        m_script.onOpen();
        m_opened = !m_script.staysClosed;
        m_position = 0;
    }
    void close() override {
        m_script.onClose();
        m_opened = false;
    }
    void skipToTime(double time) override { m_position = static_cast<int64_t>(time * m_script.rate); }
    double getDuration() override { return static_cast<double>(m_script.frames) / m_script.rate; }
    bool isEOF() override { return m_position >= m_script.frames; }
    P<peru::IURI> getURI() override { return m_uri; }
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override {
        m_script.onRead();
        if (isEOF()) return nullptr;
        const int64_t frames = std::min<int64_t>(m_script.chunkFrames, m_script.frames - m_position);
        P<peru::IMemoryBlock> block =
            peru::make<peru::CMemoryBlock>(frames * m_script.channels * m_script.bytesPerSample);
        std::fill_n(block->getData(), block->getSize(), uint8_t{0});
        auto* samples = reinterpret_cast<int16_t*>(block->getData());
        for (int64_t f = 0; m_script.bytesPerSample == 2 && f < frames; ++f)
            for (int c = 0; c < m_script.channels; ++c)
                *samples++ = static_cast<int16_t>(((m_position + f) * 4 + c) & 0x7fff);
        const double timestamp = static_cast<double>(m_position) / m_script.rate;
        m_position += frames;
        return peru::make<sonora2::audio::CAudioChunk>(timestamp, block);
    }
    int getSampleRate() override { return m_script.rate; }
    int getChannelCount() override { return m_script.channels; }
    int getBytesPerSample() override { return m_script.bytesPerSample; }

private:
    SFakeSource m_script;
    P<peru::IURI> m_uri;
    int64_t m_position = 0;
};

// Counts the bytes written to it. By default it expects the format of a default CFakeSource.
class CFakeFormat : public CFormatBase, public sonora2::common::IDiscardable {
public:
    static sonora2::common::ISonoraPlugin::SFormatParams takes(int rate, int channels, int bytesPerSample) {
        sonora2::common::ISonoraPlugin::SFormatParams params;
        params.nSampleRate = rate;
        params.nChannelCount = channels;
        params.nBytesPerSample = bytesPerSample;
        return params;
    }
    explicit CFakeFormat(
        const sonora2::common::ISonoraPlugin::SFormatParams& params = takes(1000, 2, 2),
        std::function<void()> onWrite = [] {})
        : params(params), m_onWrite(std::move(onWrite)) {}

    sonora2::common::ISonoraPlugin::SFormatParams params;
    double quality = -1.0;
    int bitRates[3] = {-1, -1, -1};
    int64_t bytes = 0;
    bool isDiscarded = false;

    void open() override { m_opened = true; }
    void discard() noexcept override {
        isDiscarded = true;
        m_opened = false;
    }
    void close() override { m_opened = false; }
    int64_t getEstimatedSizeBytes(double duration) override {
        return static_cast<int64_t>(duration * params.nSampleRate * params.nChannelCount *
                                    params.nBytesPerSample);
    }
    int getSampleRate() override { return params.nSampleRate; }
    int getChannelCount() override { return params.nChannelCount; }
    int getBytesPerSample() override { return params.nBytesPerSample; }
    void setAudioQuality(double value) override { quality = value; }
    void setAudioBitRate(int nominal, int min, int max) override {
        bitRates[0] = nominal;
        bitRates[1] = min;
        bitRates[2] = max;
    }
    void writeAudioChunk(const P<sonora2::audio::IAudioChunk>& chunk) override {
        m_onWrite();
        bytes += chunk->getSize();
    }

private:
    std::function<void()> m_onWrite;
};

// Creates objects through its functions; by default none.
class CFakePlugin : public peru::CObject, public sonora2::common::ISonoraPlugin {
public:
    using SourceFactory =
        std::function<P<sonora2::common::ISource>(const P<peru::IURI>&, const SSourceParams&)>;
    using FormatFactory =
        std::function<P<sonora2::common::IFormat>(const P<peru::IURI>&, const SFormatParams&)>;

    CFakePlugin(const char* name, std::initializer_list<const char*> extensions)
        : m_name(peru::CString::fromUTF8(name)) {
        for (const char* extension : extensions)
            m_extensions->addExtension(peru::CString::fromUTF8(extension));
    }

    SourceFactory makeSource = [](const P<peru::IURI>&, const SSourceParams&) { return nullptr; };
    FormatFactory makeFormat = [](const P<peru::IURI>&, const SFormatParams&) { return nullptr; };
    int sourceCalls = 0;
    int mask = 0; // of the last call

    P<peru::IString> getPluginName() override { return m_name; }
    int getValidTypes() override { return 0x5B; }
    P<sonora2::common::IPluginExtensions> getValidExtensions(int) override { return m_extensions; }
    P<sonora2::common::ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool,
                                                const SSourceParams* params) override {
        ++sourceCalls;
        mask = nTypes;
        return makeSource(uri, *params);
    }
    P<sonora2::common::IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool,
                                                const SFormatParams* params) override {
        mask = nTypes;
        return makeFormat(uri, *params);
    }
    P<peru::IBase> tryCreateObject(const P<peru::IURI>&, const SObjectParams* params) override {
        return params->nSize == 4 ? P<peru::IBase>(m_extensions) : nullptr;
    }

private:
    P<peru::IString> m_name;
    P<sonora2::common::CPluginExtensions> m_extensions = peru::make<sonora2::common::CPluginExtensions>();
};

} // namespace tests
