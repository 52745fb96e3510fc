// Reads and writes files with the extension "faulty". A name such as "null-write@open.faulty" is an order to
// commit that fault in that operation; with any other name the plug-in is healthy: a source delivers as many
// frames of a deterministic signal as the text in the file says, and a format writes the samples as they are.
// A name with "movie" before the extension, such as "abort@getWidth.movie.faulty", is that of a video with
// sound.
#include "isolation/plugin/Faults.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/media/IVideoSource.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/plugins/IVideoFormat.h"
#include "support/FakeMedia.h"
#include "support/MediaFile.h"
#include "support/OutputFile.h"
#include "support/PluginBase.h"

#include <fstream>
#include <sstream>

namespace faulty {

using namespace sonora2::common;
using namespace tests;
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
    template <class T> T get(const char* operation, T value) const {
        commitFault(operation);
        return value;
    }
    // The same for an operation that changes something. It leaves a line in the log.
    template <class... Values> void call(const char* operation, Values... values) const {
        std::ostringstream line;
        ((line << operation) << ... << (" " + std::to_string(values)));
        if (m_log) m_log->log(kSeverityTrace, peru::CString::fromUTF8(line.str()));
        commitFault(operation);
    }
    void commitFault(const char* operation) const {
        if (m_operation != operation) return;
        if (m_fault == "flood-log") floodLog();
        if (m_fault == "log-exception") m_log->logException(peru::CError("text", "title"));
        commit(m_fault);
    }

private:
    void floodLog() const {
        const P<peru::IString> line = peru::CString::fromUTF8(std::string(1000, 'x'));
        for (int i = 0; m_log && i < 20'000; ++i) m_log->log(kSeverityError, line);
    }

    P<ILogManager> m_log;
    std::string m_fault;
    std::string m_operation;
};

class CFaultySource : public CFakeSource {
public:
    CFaultySource(const SFakeSource& script, const P<peru::IURI>& uri, COrder order)
        : CFakeSource(script, uri), m_order(std::move(order)) {}
    ~CFaultySource() override { m_order.commitFault("destroy"); }

    bool isOpened() override { return m_order.get("isOpened", CFakeSource::isOpened()); }
    void skipToTime(double time) override {
        m_order.call("skipToTime", time);
        m_picture = static_cast<int>(time / 0.25);
        CFakeSource::skipToTime(time);
    }
    double getDuration() override { return m_order.get("getDuration", CFakeSource::getDuration()); }
    int getBufferStatus() override { return m_order.get("getBufferStatus", 100 - m_picture); }
    bool isEOF() override { return m_order.get("isEOF", m_picture == 6 || CFakeSource::isEOF()); }
    void setStartTime(double time) override { // at its start again
        m_order.call("setStartTime", m_startTime = time);
        CFakeSource::skipToTime(m_picture = 0);
    }
    double getStartTime() override { return m_order.get("getStartTime", m_startTime); }
    P<peru::IString> getPluginName() override { return peru::newString("sonora2_faulty"); }
    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override {
        const auto infos = peru::make<sonora2::audio::CAudioStreamInfos>();
        infos->add(peru::make<sonora2::audio::CAudioInfo>(7));
        return m_order.get("getAudioStreamInfos", infos);
    }
    void setAudioStream(int stream) override { m_order.call("setAudioStream", stream); }
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override {
        const auto chunk = CFakeSource::getNextAudioChunk();
        if (!chunk) m_order.call("end");
        return chunk;
    }
    int getSampleRate() override { return m_order.get("getSampleRate", CFakeSource::getSampleRate()); }
    int getChannelCount() override { return m_order.get("getChannelCount", 2); }
    int getBytesPerSample() override { return m_order.get("getBytesPerSample", 2); }

protected:
    COrder m_order;
    int m_picture = 0; // the next one of a movie

private:
    double m_startTime = 0.0;
};

class CFaultyMovie : public CFaultySource,
                     public IVideoSource,
                     public IFloatSamples,
                     public IMediaDescription,
                     public ISalvage,
                     public IClippingPrevention {
public:
    using CFaultySource::CFaultySource;
    std::string codec;

    void setMaxSize(int width, int height) override { m_order.call("setMaxSize", width, height); }
    int getWidth() override { return m_order.get("getWidth", 6); }
    int getHeight() override { return m_order.get("getHeight", 4); }
    double peekNextPictureTimestamp() override {
        return m_order.get("peekNextPictureTimestamp", m_picture * 0.25);
    }
    P<ISonoraPicture> getNextPicture() override {
        m_order.commitFault("getNextPicture");
        if (m_picture == 6) return nullptr;
        const P<peru::IMemoryBlock> block = peru::make<peru::CMemoryBlock>(16);
        std::fill_n(block->getData(), 16, static_cast<uint8_t>(m_picture));
        const double time = 0.25 * m_picture++;
        return peru::make<CRGBPicture>(peru::make<peru::CMemoryManager>(), time, 2, 2, false, block);
    }
    int getPixelAspectNum() override { return m_order.get("getPixelAspectNum", 16); }
    int getPixelAspectDen() override { return m_order.get("getPixelAspectDen", 15); }
    double getFrameDuration() override { return m_order.get("getFrameDuration", 0.25); }
    int getFrameRateNum() override { return m_order.get("getFrameRateNum", 8); }
    int getFrameRateDen() override { return m_order.get("getFrameRateDen", 2); }
    bool canUseFloat(int bytes) override { return bytes == 8; }
    void useFloat(int bytes) override { m_order.call("useFloat", bytes); }
    P<peru::IString> getCodecName() override { return peru::CString::fromUTF8(codec); }
    int64_t getBitRate() override { return int64_t{5} << 32; }
    int getOwnSampleRate() override { return 22'050; }
    int getOwnChannelCount() override { return 5; }
    int getOwnBytesPerSample() override { return 3; }
    void setDeliveredFormat(int rate, int channels, int bytes) override {
        m_order.call("setDeliveredFormat", rate, channels, bytes);
    }
    P<peru::IString> takeWarnings() override { return peru::newString("a warning"); }
    void setSalvage(bool salvage) override { m_order.call("setSalvage", m_salvage = salvage); }
    bool getSalvage() override { return m_salvage; }
    void setClippingPrevention(bool on) override { m_order.call("setClippingPrevention", m_prevent = on); }
    bool getClippingPrevention() override { return m_prevent; }

private:
    bool m_salvage = false, m_prevent = false;
};

class CFaultyFormat : public CFakeFormat, public IVideoFormat, public IFloatSamples, public IFormatSettings {
public:
    CFaultyFormat(const P<peru::IURI>& uri, const ISonoraPlugin::SFormatParams& params, COrder order)
        : CFakeFormat(params), m_uri(uri), m_order(std::move(order)) {}
    ~CFaultyFormat() override { m_order.commitFault("destroy"); }

    void open() override {
        m_order.call("open");
        m_file = std::make_unique<COutputFile>(SMediaFile(m_uri));
        m_order.commitFault("opened");
        CFakeFormat::open();
    }
    void writeAudioChunk(const P<sonora2::audio::IAudioChunk>& chunk) override {
        m_file->write(chunk->getData(), static_cast<size_t>(chunk->getSize()));
        m_file->flush();
        m_order.commitFault("writeAudioChunk");
        CFakeFormat::writeAudioChunk(chunk);
    }
    void close() override {
        m_order.call("close");
        if (m_file) m_file->close();
        m_file.reset();
        CFakeFormat::close();
    }
    void discard() noexcept override {
        m_order.call("discard");
        if (m_file) m_file->discard();
        m_file.reset();
        CFakeFormat::discard();
    }
    int64_t getEstimatedSizeBytes(double duration) override {
        return m_order.get("getEstimatedSizeBytes", CFakeFormat::getEstimatedSizeBytes(duration));
    }
    void setAudioQuality(double quality) override { m_order.call("setAudioQuality", quality); }
    P<peru::IURI> getURI() override { return m_uri; }
    P<peru::IString> getPluginName() override { return peru::newString("sonora2_faulty"); }
    bool isOpened() override { return m_order.get("isOpened", CFakeFormat::isOpened()); }
    int getSampleRate() override { return m_order.get("getSampleRate", params.nSampleRate); }
    int getChannelCount() override { return m_order.get("getChannelCount", params.nChannelCount); }
    int getBytesPerSample() override { return m_order.get("getBytesPerSample", params.nBytesPerSample); }
    void setAudioBitRate(int nominal, int least, int most) override {
        m_order.call("setAudioBitRate", nominal, least, most);
    }
    ISonoraPlugin::SFormatParams getVideoParameter() override {
        return m_order.get("getVideoParameter", params);
    }
    void writeFrame(const P<ISonoraPicture>& picture) override {
        m_order.call("writeFrame", picture ? picture->getTimestamp() : -1.0);
    }
    int getWantedImageType() override { return m_order.get("getWantedImageType", 3); }
    bool canUseFloat(int bytes) override { return bytes == 8; }
    void useFloat(int bytes) override { m_order.call("useFloat", bytes); }
    uint32_t getUsedSettings() override { return kQuality | kSampleWidth; }

private:
    P<peru::IURI> m_uri;
    COrder m_order;
    std::unique_ptr<COutputFile> m_file;
};

class CFaultyPlugin : public CFakePlugin {
public:
    explicit CFaultyPlugin(const P<ISonoraContext>& context)
        : CFakePlugin("sonora2_faulty", {"faulty"}), m_context(context) {}

    P<ISource> tryCreateSource(const P<peru::IURI>& uri, int types, bool isKept,
                               const SSourceParams* params) override {
        const COrder order(uri, m_context->getLogManager());
        order.call("create", types, isKept, params->nSampleRate);
        SFakeSource script;
        if (params->nSampleRate > 0) script.rate = params->nSampleRate;
        script.onOpen = [order] { order.call("open"); };
        script.onClose = [order] { order.call("close"); };
        script.onRead = [order] { order.commitFault("getNextAudioChunk"); };
        std::ifstream(SMediaFile(uri).path) >> script.frames;
        if (!peru::CString::toStdString(uri->getFileName()).ends_with(".movie.faulty"))
            return peru::make<CFaultySource>(script, uri, order);
        const auto movie = peru::make<CFaultyMovie>(script, uri, order);
        movie->codec = std::to_string(m_context->getFlags()) + " " + std::to_string(m_context->getSwitchB()) +
                       " " + peru::CString::toStdString(m_context->getParameter(9, "test"));
        return movie;
    }
    P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int types, bool isKept,
                               const SFormatParams* params) override {
        const COrder order(uri, m_context->getLogManager());
        order.call("create", types, isKept, params->nSampleRate);
        if (params->nChannelCount > 8) return nullptr;
        return peru::make<CFaultyFormat>(uri, *params, order);
    }

private:
    P<ISonoraContext> m_context;
};

} // namespace faulty

SONORA2_PLUGIN(faulty::CFaultyPlugin);
