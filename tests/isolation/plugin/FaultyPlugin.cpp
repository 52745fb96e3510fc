// Reads and writes files with the extension "faulty". A name such as "null-write@open.faulty" is an order to
// commit that fault in that operation; with any other name the plug-in is healthy: a source delivers as many
// frames of a deterministic signal as the text in the file says, and a format writes the samples as they are.
// A name with "movie" before the extension, such as "abort@getWidth.movie.faulty", is that of a video with
// sound.
#include "isolation/plugin/Faults.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/media/IVideoSource.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/plugins/IVideoFormat.h"
#include "support/FakeMedia.h"
#include "support/MediaFile.h"
#include "support/OutputFile.h"
#include "support/PluginBase.h"

#include <fstream>

namespace faulty {

using namespace tests;
using sonora2::common::ILogManager;
using sonora2::plugins::COutputFile;
using sonora2::plugins::SMediaFile;

// The fault and its operation, from the name of the file.
class COrder {
public:
    COrder(const P<peru::IURI>& uri, const P<ILogManager>& log) : m_log(log) {
        const std::string name = peru::CString::toStdString(uri->getFileName());
        const size_t at = name.find('@');
        if (at == std::string::npos) return;
        m_fault = name.substr(0, at);
        m_operation = name.substr(at + 1, name.find('.', at) - at - 1);
    }
    // Returns the value if the fault returns.
    template <class T> T onOperation(const char* operation, T value) const {
        onOperation(operation);
        return value;
    }
    void onOperation(const char* operation) const {
        if (m_operation != operation) return;
        if (m_fault == "flood-log") floodLog();
        commit(m_fault);
    }

private:
    void floodLog() const {
        const P<peru::IString> line = peru::CString::fromUTF8(std::string(1000, 'x'));
        for (int i = 0; m_log && i < 20'000; ++i) m_log->log(sonora2::common::kSeverityError, line);
    }

    P<ILogManager> m_log;
    std::string m_fault;
    std::string m_operation;
};

class CFaultySource : public CFakeSource {
public:
    CFaultySource(const SFakeSource& script, const P<peru::IURI>& uri, COrder order)
        : CFakeSource(script, uri), m_order(std::move(order)) {}
    ~CFaultySource() override { m_order.onOperation("destroy"); }

    bool isOpened() override { return m_order.onOperation("isOpened", CFakeSource::isOpened()); }
    void skipToTime(double time) override {
        m_order.onOperation("skipToTime");
        CFakeSource::skipToTime(time);
    }
    double getDuration() override { return m_order.onOperation("getDuration", CFakeSource::getDuration()); }
    int getBufferStatus() override { return m_order.onOperation("getBufferStatus", 100); }
    bool isEOF() override { return m_order.onOperation("isEOF", CFakeSource::isEOF()); }
    void setStartTime(double) override { m_order.onOperation("setStartTime"); }
    double getStartTime() override { return m_order.onOperation("getStartTime", 0.0); }
    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override {
        return m_order.onOperation("getAudioStreamInfos", peru::make<sonora2::audio::CAudioStreamInfos>());
    }
    void setAudioStream(int) override { m_order.onOperation("setAudioStream"); }
    int getSampleRate() override {
        return m_order.onOperation("getSampleRate", CFakeSource::getSampleRate());
    }
    int getChannelCount() override { return m_order.onOperation("getChannelCount", 2); }
    int getBytesPerSample() override { return m_order.onOperation("getBytesPerSample", 2); }

protected:
    COrder m_order;
};

class CFaultyMovie : public CFaultySource, public sonora2::common::IVideoSource {
public:
    using CFaultySource::CFaultySource;

    void setMaxSize(int, int) override { m_order.onOperation("setMaxSize"); }
    int getWidth() override { return m_order.onOperation("getWidth", 2); }
    int getHeight() override { return m_order.onOperation("getHeight", 2); }
    double peekNextPictureTimestamp() override {
        return m_order.onOperation("peekNextPictureTimestamp", 0.0);
    }
    P<sonora2::common::ISonoraPicture> getNextPicture() override {
        const P<peru::IMemoryBlock> block = peru::make<peru::CMemoryBlock>(16);
        std::fill_n(block->getData(), 16, uint8_t{0});
        return m_order.onOperation(
            "getNextPicture", peru::make<sonora2::common::CRGBPicture>(peru::make<peru::CMemoryManager>(),
                                                                       0.0, 2, 2, false, block));
    }
    int getPixelAspectNum() override { return m_order.onOperation("getPixelAspectNum", 1); }
    int getPixelAspectDen() override { return m_order.onOperation("getPixelAspectDen", 1); }
    double getFrameDuration() override { return m_order.onOperation("getFrameDuration", 0.04); }
    int getFrameRateNum() override { return m_order.onOperation("getFrameRateNum", 25); }
    int getFrameRateDen() override { return m_order.onOperation("getFrameRateDen", 1); }
};

class CFaultyFormat : public CFakeFormat, public sonora2::common::IVideoFormat {
public:
    CFaultyFormat(const P<peru::IURI>& uri, const sonora2::common::ISonoraPlugin::SFormatParams& params,
                  COrder order)
        : CFakeFormat(params), m_uri(uri), m_order(std::move(order)) {}
    ~CFaultyFormat() override { m_order.onOperation("destroy"); }

    void open() override {
        m_order.onOperation("open");
        m_file = std::make_unique<COutputFile>(SMediaFile(m_uri));
        CFakeFormat::open();
    }
    void writeAudioChunk(const P<sonora2::audio::IAudioChunk>& chunk) override {
        m_file->write(chunk->getData(), static_cast<size_t>(chunk->getSize()));
        m_file->flush();
        m_order.onOperation("writeAudioChunk");
        CFakeFormat::writeAudioChunk(chunk);
    }
    void close() override {
        m_order.onOperation("close");
        if (m_file) m_file->close();
        m_file.reset();
        CFakeFormat::close();
    }
    void discard() noexcept override {
        if (m_file) m_file->discard();
        m_file.reset();
        CFakeFormat::discard();
    }
    int64_t getEstimatedSizeBytes(double duration) override {
        m_order.onOperation("getEstimatedSizeBytes");
        return CFakeFormat::getEstimatedSizeBytes(duration);
    }
    void setAudioQuality(double quality) override {
        m_order.onOperation("setAudioQuality");
        CFakeFormat::setAudioQuality(quality);
    }
    P<peru::IURI> getURI() override { return m_uri; }
    bool isOpened() override { return m_order.onOperation("isOpened", CFakeFormat::isOpened()); }
    int getSampleRate() override {
        return m_order.onOperation("getSampleRate", CFakeFormat::getSampleRate());
    }
    int getChannelCount() override { return m_order.onOperation("getChannelCount", 2); }
    int getBytesPerSample() override { return m_order.onOperation("getBytesPerSample", 2); }
    void setAudioBitRate(int, int, int) override { m_order.onOperation("setAudioBitRate"); }
    sonora2::common::ISonoraPlugin::SFormatParams getVideoParameter() override {
        return m_order.onOperation("getVideoParameter", params);
    }
    void writeFrame(const P<sonora2::common::ISonoraPicture>&) override { m_order.onOperation("writeFrame"); }
    int getWantedImageType() override { return m_order.onOperation("getWantedImageType", 1); }

private:
    P<peru::IURI> m_uri;
    COrder m_order;
    std::unique_ptr<COutputFile> m_file;
};

class CFaultyPlugin : public CFakePlugin {
public:
    explicit CFaultyPlugin(const P<sonora2::common::ISonoraContext>& context)
        : CFakePlugin("sonora2_faulty", {"faulty"}) {
        const P<ILogManager> log = context->getLogManager();
        makeSource = [log](const P<peru::IURI>& uri,
                           const SSourceParams& params) -> P<sonora2::common::ISource> {
            const COrder order(uri, log);
            order.onOperation("create");
            SFakeSource script;
            if (params.nSampleRate > 0) script.rate = params.nSampleRate;
            script.onOpen = [order] { order.onOperation("open"); };
            script.onClose = [order] { order.onOperation("close"); };
            script.onRead = [order] { order.onOperation("getNextAudioChunk"); };
            std::ifstream(SMediaFile(uri).path) >> script.frames;
            if (peru::CString::toStdString(uri->getFileName()).ends_with(".movie.faulty"))
                return peru::make<CFaultyMovie>(script, uri, order);
            return peru::make<CFaultySource>(script, uri, order);
        };
        makeFormat = [log](const P<peru::IURI>& uri, const SFormatParams& params) {
            const COrder order(uri, log);
            order.onOperation("create");
            return peru::make<CFaultyFormat>(uri, params, order);
        };
    }
};

} // namespace faulty

SONORA2_PLUGIN(faulty::CFaultyPlugin);
