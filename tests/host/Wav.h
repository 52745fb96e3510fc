// PCM WAV files, written and read here so that the tests share no code with the program under test.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <random>
#include <stdexcept>
#include <string>

namespace tests {

struct SSound {
    int rate = 44100;
    int channels = 2;
    int bits = 16;
    std::string samples; // as stored in a WAV file

    size_t frameBytes() const { return static_cast<size_t>(channels * (bits / 8)); }
    size_t frames() const { return samples.size() / frameBytes(); }
    double seconds() const { return static_cast<double>(frames()) / rate; }

    // From -1.0 to 1.0.
    double at(size_t frame, int channel) const {
        const size_t width = static_cast<size_t>(bits / 8);
        uint32_t value = 0;
        std::memcpy(reinterpret_cast<char*>(&value) + 4 - width,
                    samples.data() + frame * frameBytes() + static_cast<size_t>(channel) * width, width);
        if (bits == 8) value ^= 0x80000000;
        return static_cast<double>(static_cast<int32_t>(value)) / 2147483648.0;
    }
};

inline bool operator==(const SSound& a, const SSound& b) {
    return a.rate == b.rate && a.channels == b.channels && a.bits == b.bits && a.samples == b.samples;
}

inline std::string describe(const SSound& sound) {
    return std::to_string(sound.rate) + "_" + std::to_string(sound.channels) + "ch_" +
           std::to_string(sound.bits) + "bit";
}

// Noise of all sample values.
inline SSound makeNoise(int rate, int channels, int bits, size_t frames, uint32_t seed = 1) {
    SSound sound{rate, channels, bits, {}};
    std::mt19937 random(seed);
    sound.samples.resize(frames * sound.frameBytes());
    for (char& byte : sound.samples) byte = static_cast<char>(random());
    return sound;
}

// A tone of half of full scale; channel n has n + 1 times the frequency.
inline SSound makeTone(int rate, int channels, int bits, double seconds, double frequency = 440) {
    SSound sound{rate, channels, bits, {}};
    const size_t width = static_cast<size_t>(bits / 8), frames = static_cast<size_t>(seconds * rate);
    for (size_t frame = 0; frame < frames; ++frame)
        for (int channel = 0; channel < channels; ++channel) {
            const double angle = 2 * M_PI * frequency * (channel + 1) * static_cast<double>(frame) / rate;
            uint32_t value = static_cast<uint32_t>(std::lround(std::sin(angle) * 1073741824.0));
            if (bits == 8) value ^= 0x80000000;
            sound.samples.append(reinterpret_cast<const char*>(&value) + 4 - width, width);
        }
    return sound;
}

inline void appendNumber(std::string& bytes, uint32_t value, int width) {
    bytes.append(reinterpret_cast<const char*>(&value), static_cast<size_t>(width));
}

// The header of a file with `dataBytes` bytes of samples, which are not included.
inline std::string makeWavHeader(const SSound& sound, uint32_t dataBytes) {
    std::string header = "RIFF";
    const uint32_t frameBytes = static_cast<uint32_t>(sound.frameBytes());
    appendNumber(header, dataBytes + 36, 4);
    header += "WAVEfmt ";
    appendNumber(header, 16, 4);
    appendNumber(header, 1, 2);
    appendNumber(header, static_cast<uint32_t>(sound.channels), 2);
    appendNumber(header, static_cast<uint32_t>(sound.rate), 4);
    appendNumber(header, static_cast<uint32_t>(sound.rate) * frameBytes, 4);
    appendNumber(header, frameBytes, 2);
    appendNumber(header, static_cast<uint32_t>(sound.bits), 2);
    header += "data";
    appendNumber(header, dataBytes, 4);
    return header;
}

inline std::string toWav(const SSound& sound) {
    std::string bytes = makeWavHeader(sound, static_cast<uint32_t>(sound.samples.size())) + sound.samples;
    if (sound.samples.size() % 2 != 0) bytes += '\0';
    return bytes;
}

inline SSound parseWav(const std::string& bytes) {
    const auto number = [&](size_t at, size_t width) {
        uint32_t value = 0;
        if (at + width > bytes.size()) throw std::runtime_error("WAV file cut short");
        std::memcpy(&value, bytes.data() + at, width);
        return value;
    };
    if (bytes.substr(0, 4) != "RIFF" || bytes.substr(8, 4) != "WAVE") throw std::runtime_error("no WAV file");
    SSound sound;
    for (size_t at = 12; at + 8 <= bytes.size();) {
        const std::string id = bytes.substr(at, 4);
        const size_t size = number(at + 4, 4);
        if (id == "fmt ") {
            sound.channels = static_cast<int>(number(at + 10, 2));
            sound.rate = static_cast<int>(number(at + 12, 4));
            sound.bits = static_cast<int>(number(at + 22, 2));
        } else if (id == "data") {
            sound.samples = bytes.substr(at + 8, size);
            if (sound.samples.size() != size) throw std::runtime_error("WAV samples cut short");
            return sound;
        }
        at += 8 + size + size % 2;
    }
    throw std::runtime_error("WAV file without samples");
}

// Measured by zero crossings in the middle of the sound, since lossy codecs change its ends.
inline double measureFrequency(const SSound& sound, int channel) {
    const size_t first = sound.frames() / 4, last = sound.frames() * 3 / 4;
    int crossings = 0;
    for (size_t i = first; i < last; ++i)
        crossings += (sound.at(i, channel) < 0) != (sound.at(i + 1, channel) < 0);
    return crossings / 2.0 * sound.rate / static_cast<double>(last - first);
}

inline double measureLevel(const SSound& sound, int channel) {
    double squares = 0;
    for (size_t i = 0; i < sound.frames(); ++i) squares += std::pow(sound.at(i, channel), 2);
    return std::sqrt(squares / static_cast<double>(std::max<size_t>(sound.frames(), 1)));
}

} // namespace tests
