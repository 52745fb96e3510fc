// Common parts of the tests' sources and formats, and their data.
#pragma once

#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/IAudioFormat.h"
#include "sonora2/media/IAudioSource.h"

#include <string>

namespace tests {

using peru::P;

// Implements the parts of the interface that do not matter to the tests.
template <class Interface> class TSourceBase : public peru::CObject, public Interface {
public:
    int opens = 0;

    bool isOpened() override { return m_opened; }
    int getBufferStatus() override { return 100; }
    void setStartTime(double) override {}
    double getStartTime() override { return 0.0; }
    P<peru::IURI> getURI() override { return nullptr; }
    P<peru::IString> getPluginName() override { return peru::CString::fromUTF8("fake"); }

protected:
    bool m_opened = false;
};

class CSourceBase : public TSourceBase<sonora2::common::IAudioSource> {
public:
    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override { return nullptr; }
    void setAudioStream(int) override {}
};

class CFormatBase : public peru::CObject, public sonora2::common::IAudioFormat {
public:
    bool isOpened() override { return m_opened; }
    P<peru::IURI> getURI() override { return nullptr; }
    P<peru::IString> getPluginName() override { return peru::CString::fromUTF8("fake"); }

protected:
    bool m_opened = false;
};

inline std::string bytesOf(const P<sonora2::audio::IAudioChunk>& chunk) {
    return std::string(reinterpret_cast<const char*>(chunk->getData()), chunk->getSize());
}

// Reads the rest of a source.
inline std::string readAll(const P<sonora2::common::IAudioSource>& source) {
    std::string bytes;
    while (const P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk()) bytes += bytesOf(chunk);
    return bytes;
}

// Bytes without a period, so that a lost or repeated one is detected.
inline std::string patternBytes(size_t count) {
    std::string bytes(count, '\0');
    for (size_t i = 0; i < count; ++i) bytes[i] = static_cast<char>((i * 2654435761u) >> 13);
    return bytes;
}

// Converts objects to their serial form and back.
inline std::string serialise(const P<peru::ISerializable>& object) {
    const P<peru::CMemoryIOStream> memory = peru::make<peru::CMemoryIOStream>();
    object->writeTo(peru::make<peru::CDataOutStream>(memory));
    return std::string(reinterpret_cast<const char*>(memory->getBlock()->getData()),
                       static_cast<size_t>(memory->getSize()));
}

inline void deserialise(const P<peru::ISerializable>& object, const std::string& bytes) {
    const P<peru::CMemoryIOStream> memory = peru::make<peru::CMemoryIOStream>();
    memory->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    memory->seek(0);
    object->readFrom(peru::make<peru::CDataInStream>(memory));
}

} // namespace tests
