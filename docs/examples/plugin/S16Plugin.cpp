// A media plug-in that reads and writes .s16 files: 44.1 kHz stereo samples of 16 bits without a header.
#include "support/PluginBase.h"

#include <sys/stat.h>

namespace {

using namespace sonora2::plugins;

constexpr SPcmFormat kFormat{44100, 2, 2};
constexpr int kFrameBytes = 4;

class CS16Decoder : public IDecoder {
public:
    explicit CS16Decoder(const SMediaFile& file) : m_file(file) {}

    SDecodedMedia open(const SDecoderOptions&) override {
        m_input = openForReading(m_file);
        struct stat status {};
        if (::fstat(::fileno(m_input.get()), &status) != 0) failSystem("could not open", m_file, errno);
        return {kFormat, status.st_size / kFrameBytes, "PCM signed 16 bit"};
    }
    void close() override { m_input.reset(); }
    int read(uint8_t* pcm, int frames) override {
        const size_t count = std::fread(pcm, kFrameBytes, static_cast<size_t>(frames), m_input.get());
        if (count == 0 && std::ferror(m_input.get())) failSystem("could not read", m_file, errno);
        return static_cast<int>(count);
    }
    void seek(int64_t frame) override {
        if (::fseeko(m_input.get(), frame * kFrameBytes, SEEK_SET) != 0)
            failSystem("could not read", m_file, errno);
    }

private:
    SMediaFile m_file;
    InputFile m_input;
};

class CS16Encoder : public IEncoder {
public:
    bool accepts(const SPcmFormat& format) const override { return format == kFormat; }
    void open(COutputFile& file, const SEncoderSettings&) override { m_output = &file; }
    void write(const uint8_t* pcm, int frames) override {
        m_output->write(pcm, static_cast<size_t>(frames) * kFrameBytes);
    }
    void finish() override {}
    int64_t estimateBytes(double seconds, const SEncoderSettings&) const override {
        return static_cast<int64_t>(seconds * kFormat.rate) * kFrameBytes;
    }

private:
    COutputFile* m_output = nullptr;
};

class CS16Plugin : public CPluginBase {
public:
    explicit CS16Plugin(const P<sonora2::common::ISonoraContext>& context)
        : CPluginBase(context, "sonora2_s16", {"s16"}, {"s16"}) {}

protected:
    std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override {
        return std::make_unique<CS16Decoder>(file);
    }
    CEncoderFormat::EncoderFactory getEncoderFactory() override {
        return [](const SMediaFile&) -> std::unique_ptr<IEncoder> { return std::make_unique<CS16Encoder>(); };
    }
};

} // namespace

SONORA2_PLUGIN(CS16Plugin);
