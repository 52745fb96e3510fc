#include "commands/Waveform.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ForEachFile.h"
#include "library/Failure.h"
#include "media/Output.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <png.h>
#include <stdexcept>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

struct SColour {
    uint8_t red, green, blue;
};
constexpr SColour kBackground{255, 255, 255}, kAxis{200, 205, 212}, kPeak{116, 160, 214},
    kLoudness{33, 84, 150};

// Steps per column of the picture; the library delivers them in blocks of 100 and drops an incomplete last
// block.
constexpr int kStepsPerColumn = 200;

// One column of one channel.
struct SColumn {
    float low = 0;
    float high = 0;
    double squares = 0;
    size_t count = 0;

    void add(float sample) {
        low = count ? std::min(low, sample) : sample;
        high = count ? std::max(high, sample) : sample;
        squares += static_cast<double>(sample) * sample;
        ++count;
    }
};

struct SWave {
    int channels;
    int width;
    double stepsPerColumn;
    size_t steps = 0;
    std::vector<SColumn> columns; // grouped by channel

    size_t indexOf(int channel, int column) const {
        return static_cast<size_t>(channel) * static_cast<size_t>(width) + static_cast<size_t>(column);
    }
    void add(const float* samples, int32_t count) {
        for (int32_t i = 0; i + channels <= count; i += channels, ++steps) {
            const int column =
                std::min(static_cast<int>(static_cast<double>(steps) / stepsPerColumn), width - 1);
            for (int channel = 0; channel < channels; ++channel)
                columns[indexOf(channel, column)].add(samples[i + channel]);
        }
    }
};

bool onSamples(TONEWRIGHT_Handle, double, const float* samples, int32_t count, void* user) {
    static_cast<SWave*>(user)->add(samples, count);
    return !isCancelled();
}

class CPicture {
public:
    CPicture(int width, int height)
        : m_width(width), m_height(height),
          m_pixels(static_cast<size_t>(width) * static_cast<size_t>(height), kBackground) {}

    void drawColumn(int x, int top, int bottom, SColour colour) {
        for (int y = std::max(top, 0); y <= std::min(bottom, m_height - 1); ++y)
            m_pixels[static_cast<size_t>(y) * static_cast<size_t>(m_width) + static_cast<size_t>(x)] = colour;
    }

    void write(const fs::path& file) const {
        png_image image = {};
        image.version = PNG_IMAGE_VERSION;
        image.width = static_cast<png_uint_32>(m_width);
        image.height = static_cast<png_uint_32>(m_height);
        image.format = PNG_FORMAT_RGB;
        const std::unique_ptr<FILE, int (*)(FILE*)> stream(std::fopen(file.c_str(), "wbe"), std::fclose);
        errno = stream ? 0 : errno;
        // The system's reason is more specific than "Write Error".
        if (!stream || !png_image_write_to_stdio(&image, stream.get(), 0, m_pixels.data(), 0, nullptr) ||
            std::fflush(stream.get()) != 0)
            throw std::runtime_error(errno ? std::strerror(errno) : image.message);
    }

private:
    int m_width;
    int m_height;
    std::vector<SColour> m_pixels;
};

// One strip per channel: the peaks in a light colour, and over them the root mean square in a dark one.
CPicture draw(const SWave& wave, int height) {
    CPicture picture(wave.width, height);
    for (int channel = 0; channel < wave.channels; ++channel) {
        const int top = height * channel / wave.channels, bottom = height * (channel + 1) / wave.channels - 1;
        const double middle = (top + bottom) / 2.0, scale = (bottom - top) / 2.0 * 0.95;
        const auto y = [&](double value) { return static_cast<int>(std::lround(middle - value * scale)); };
        for (int x = 0; x < wave.width; ++x) {
            picture.drawColumn(x, y(0), y(0), kAxis);
            const SColumn& column = wave.columns[wave.indexOf(channel, x)];
            if (column.count == 0) continue;
            picture.drawColumn(x, y(column.high), y(column.low), kPeak);
            const double loudness = std::sqrt(column.squares / static_cast<double>(column.count));
            picture.drawColumn(x, y(std::min<double>(loudness, column.high)),
                               y(std::max<double>(-loudness, column.low)), kLoudness);
        }
    }
    return picture;
}

void drawFile(CLibrary& library, const SWaveformOptions& options) {
    checkInput(options.input);
    if (isSameFile(options.input, options.output))
        throw std::runtime_error(tr("host.sameFile", "Input and output are the same file"));
    COutput place(options.output, ".part" + std::to_string(::getpid()), options.force);
    SSoundFile sound = openSoundFile(options.input);
    const SSampleFormat samples = sound.samples;
    const double duration = sound.info.duration;
    // The library delivers waveforms of 16-bit sound only.
    clearFailure();
    if (TONEWRIGHT_Host_SetSourceFormat(sound.source.get(), samples.rate, samples.channels, 2) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.unreadable", "The file cannot be read"), options.input));
    const CHandle& source = sound.source;

    const double frames = duration * samples.rate;
    const double step =
        std::max(std::floor(frames / (static_cast<double>(options.width) * kStepsPerColumn)), 1.0);
    SWave wave{samples.channels, options.width, std::max(frames / step / options.width, 1e-9), 0, {}};
    wave.columns.resize(static_cast<size_t>(wave.channels) * static_cast<size_t>(wave.width));
    // Half a frame more, so that the library's truncation results in the intended whole number.
    const bool complete = library.AudioSource_FetchStreamSamples(source.get(), onSamples,
                                                                 (step + 0.5) / samples.rate, &wave) != 0;
    if (isCancelled()) return;
    if (!complete)
        throw std::runtime_error(
            takeFailure(tr("host.Waveform.samples", "The samples could not be read"), options.input));
    const CPicture picture = draw(wave, options.height);
    try {
        picture.write(place.getTemporary());
    } catch (const std::exception& error) {
        throw std::runtime_error(tr("host.Waveform.write", "Could not write %FILE%: %REASON%",
                                    {{"%FILE%", options.output.string()}, {"%REASON%", error.what()}}));
    }
    place.commit();
}

} // namespace

int drawWaveform(CLibrary& library, const SWaveformOptions& options) {
    try {
        drawFile(library, options);
        return isCancelled() ? kExitCancelled : kExitSuccess;
    } catch (const std::exception& error) {
        printFailure(options.input, error.what());
        return kExitFailure;
    }
}

} // namespace host
