// A host whose only plug-in is the faulty one, in a process of its own.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/boxed/EncapsulatedFormat.h"
#include "sonora2/boxed/EncapsulatedSource.h"
#include "sonora2/context/LastFailure.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/plugins/PluginHandler.h"
#include "support/Children.h"
#include "support/Environment.h"
#include "support/FakeMedia.h"
#include "support/Files.h"
#include "support/MediaBase.h"
#include "support/TempFolder.h"

#include <chrono>
#include <functional>
#include <sstream>
#include <thread>

namespace tests {

// Waits for what other processes and threads do, but not forever.
inline bool waitUntil(const std::function<bool()>& condition) {
    for (int i = 0; i < 2'000; ++i) {
        if (condition()) return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return condition();
}

template <class... Values> std::string joined(const Values&... values) {
    std::ostringstream text;
    ((text << values << ' '), ...);
    return text.str();
}

// What a video with sound answers when it is asked, and then what its optional interfaces answer.
inline std::string describe(const P<sonora2::common::ISource>& source) {
    using namespace sonora2::common;
    const peru::P<IVideoSource> video(source);
    const peru::P<IAudioSource> audio(source);
    const auto infos = audio->getAudioStreamInfos();
    std::string answers =
        joined(source->isOpened(), source->isEOF(), source->getDuration(), source->getStartTime(),
               text(source->getURI()->getAsString()), text(source->getPluginName()), video->getWidth(),
               video->getHeight(), video->peekNextPictureTimestamp(), video->getPixelAspectNum(),
               video->getPixelAspectDen(), video->getFrameDuration(), video->getFrameRateNum(),
               video->getFrameRateDen(), audio->getSampleRate(), audio->getChannelCount(),
               audio->getBytesPerSample(), infos ? infos->getStreamInfo(0)->getStreamIndex() : -1);
    if (const auto floats = peru::interfaceCast<IFloatSamples>(source))
        answers += joined(floats->canUseFloat(4), floats->canUseFloat(8));
    if (const auto media = peru::interfaceCast<IMediaDescription>(source))
        answers +=
            joined(text(media->getCodecName()), media->getBitRate(), media->getOwnSampleRate(),
                   media->getOwnChannelCount(), media->getOwnBytesPerSample(), text(media->takeWarnings()));
    if (const auto salvage = peru::interfaceCast<ISalvage>(source)) answers += joined(salvage->getSalvage());
    if (const auto clipping = peru::interfaceCast<IClippingPrevention>(source))
        answers += joined(clipping->getClippingPrevention());
    return answers;
}
inline std::string describe(const P<sonora2::common::IFormat>& format) {
    using namespace sonora2::common;
    const peru::P<IVideoFormat> video(format);
    const peru::P<IAudioFormat> audio(format);
    const auto params = video->getVideoParameter();
    return joined(format->isOpened(), text(format->getURI()->getAsString()), text(format->getPluginName()),
                  format->getEstimatedSizeBytes(2.5), video->getWantedImageType(), params.nSize,
                  params.nSampleRate, std::string(params.video, params.video + sizeof params.video),
                  audio->getSampleRate(), audio->getChannelCount(), audio->getBytesPerSample());
}

class Boxed : public testing::Test {
protected:
    Boxed() { setDeadline(30'000); }

    void setDeadline(int milliseconds) {
        m_context->setParameter(sonora2::common::kBoxedParameterKey, sonora2::common::kBoxedDeadlineParameter,
                                peru::CString::fromUTF8(std::to_string(milliseconds)));
    }
    void setMemory(int mebibytes) {
        m_context->setParameter(sonora2::common::kBoxedParameterKey, sonora2::common::kBoxedMemoryParameter,
                                peru::CString::fromUTF8(std::to_string(mebibytes)));
    }

    template <class Job> static std::string messageOf(Job job) {
        sonora2::common::clearLastFailure();
        try {
            job();
        } catch (const sonora2::common::CSonoraError& error) {
            const std::string message = text(error.getDescription());
            return message.empty() ? "an error without a text" : message;
        }
        return {};
    }

    // Run a whole job and return the message of its error; empty if there was none. Errors of other types
    // than the framework's leave the functions.
    std::string decode(const std::string& name, std::string* samples = nullptr) {
        return messageOf([&] {
            const auto uri = toURI(m_media.write(name, std::to_string(m_frames)));
            const auto source = m_handler->createAudioSource(uri, 1000, 2, 2, false);
            if (!source) throw failure();
            source->open();
            source->getDuration();
            source->skipToTime(0.5);
            source->skipToTime(0.0);
            source->getSampleRate();
            const std::string all = readAll(source);
            if (samples) *samples = all;
            source->close();
        });
    }
    std::string encode(const std::filesystem::path& target) {
        P<sonora2::common::IAudioFormat> format;
        const std::string message = messageOf([&] {
            format = m_handler->createAudioFormat(toURI(target), 1000, 2, 2);
            if (!format) throw failure();
            format->setAudioQuality(0.5);
            format->open();
            format->getEstimatedSizeBytes(1.0);
            for (int i = 0; i < 300; ++i) format->writeAudioChunk(m_chunk);
            format->close();
        });
        // As an encoding job does.
        const auto discardable = peru::interfaceCast<sonora2::common::IDiscardable>(format);
        if (!message.empty() && discardable) discardable->discard();
        return message;
    }

    // Call every operation of a source or format that the host can call, and return the message of the error.
    std::string watch(const std::string& name) {
        return messageOf([&] {
            const auto source = peru::make<sonora2::common::CEncapsulatedSource>(
                m_context, m_name, toURI(m_media.write(name, "1000")),
                sonora2::common::kAudioSource | sonora2::common::kVideoSource, nullptr);
            source->setStartTime(0.001); // is applied by opening
            source->open();
            source->getBufferStatus();
            source->setMaxSize(100, 100);
            describe(P<sonora2::common::ISource>(source));
            source->getNextPicture();
            source->setAudioStream(0);
            source->skipToTime(0.5);
            readAll(source);
            source->close();
        });
    }
    std::string produce(const std::filesystem::path& target) {
        auto params = CFakeFormat::takes(1000, 2, 2);
        const auto format = peru::make<sonora2::common::CEncapsulatedFormat>(
            m_context, m_name, toURI(target), sonora2::common::kAudioFormat | sonora2::common::kVideoFormat,
            &params);
        const std::string message = messageOf([&] {
            format->open();
            format->setAudioQuality(0.5);
            format->setAudioBitRate(128'000, 0, 0);
            describe(P<sonora2::common::IFormat>(format));
            format->writeFrame(nullptr);
            format->writeAudioChunk(m_chunk);
            format->close();
        });
        const auto discardable =
            peru::interfaceCast<sonora2::common::IDiscardable>(P<sonora2::common::IFormat>(format));
        if (!message.empty() && discardable) discardable->discard();
        return message;
    }

    // The next job works, and nothing is left of those before it.
    void expectHealthy() {
        std::string samples;
        EXPECT_EQ(decode("healthy.faulty", &samples), "");
        EXPECT_TRUE(samples == makeExpected());
        EXPECT_TRUE(waitUntil([] { return listChildren().empty(); }));
        EXPECT_EQ(countEntries(m_temporary.path()), 0u);
        EXPECT_TRUE(waitUntil([&] { return countSockets() == 0; }));
    }
    // The plug-in's signal.
    std::string makeExpected() const {
        std::string bytes;
        for (int frame = 0; frame < m_frames; ++frame)
            for (int channel = 0; channel < 2; ++channel) {
                const int sample = (frame * 4 + channel) & 0x7fff;
                bytes += {static_cast<char>(sample), static_cast<char>(sample >> 8)};
            }
        return bytes;
    }
    size_t countSockets() const {
        size_t count = 0;
        for (const auto& entry : std::filesystem::recursive_directory_iterator(m_runtime.path()))
            count += entry.is_socket();
        return count;
    }
    static size_t countDescriptors() { return countEntries("/proc/self/fd"); }

    CTempFolder m_media;
    CTempFolder m_out;
    CTempFolder m_temporary;
    CTempFolder m_runtime;
    CEnvironment m_pluginPath{"TONEWRIGHT_PLUGIN_PATH", FAULTY_PLUGINS};
    CEnvironment m_temporaryPath{"TMPDIR", m_temporary.path().string()};
    CEnvironment m_runtimePath{"XDG_RUNTIME_DIR", m_runtime.path().string()};
    P<sonora2::audio::CSonoraContextAudio> m_context = makeContext();
    P<sonora2::common::CPluginHandler> m_handler =
        peru::make<sonora2::common::CPluginHandler>(m_context, true);
    const P<sonora2::audio::IAudioChunk> m_chunk = makeChunk();
    const P<peru::IString> m_name = peru::newString("sonora2_faulty");
    int m_frames = 20'000; // of what is decoded

private:
    static P<sonora2::audio::CSonoraContextAudio> makeContext() {
        const auto context = peru::make<sonora2::audio::CSonoraContextAudio>();
        context->addPluginName("sonora2_faulty");
        return context;
    }
    static P<sonora2::audio::IAudioChunk> makeChunk() {
        const std::string bytes = patternBytes(20'000);
        const P<peru::IMemoryBlock> block =
            peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
        bytes.copy(reinterpret_cast<char*>(block->getData()), bytes.size());
        return peru::make<sonora2::audio::CAudioChunk>(0.0, block);
    }
    static sonora2::common::CSonoraError failure() {
        return sonora2::common::CSonoraError(
            peru::CString::fromUTF8(sonora2::common::getLastFailure().message));
    }
};

} // namespace tests
