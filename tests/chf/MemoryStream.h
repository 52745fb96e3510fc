// A chunk file's storage in memory.
#pragma once

#include "chf/BaseStream.h"

#include <algorithm>
#include <cstring>
#include <string>

namespace tests {

class CMemoryStream : public chf::CBaseStream {
public:
    explicit CMemoryStream(std::string content) : bytes(std::move(content)) {}

    std::string bytes;

    int64_t GetPosition() override { return m_position; }
    int64_t GetSize() override { return static_cast<int64_t>(bytes.size()); }
    void Seek(int64_t position) override { m_position = position; }
    void Write(const void* buffer, uint32_t count) override {
        const auto end = static_cast<size_t>(m_position) + count;
        if (end > bytes.size()) bytes.resize(end);
        std::memcpy(bytes.data() + m_position, buffer, count);
        m_position += count;
    }
    uint32_t Read(void* buffer, uint32_t count) override {
        const int64_t left = std::max<int64_t>(GetSize() - m_position, 0);
        const auto read = static_cast<uint32_t>(std::min<int64_t>(left, count));
        if (read > 0) std::memcpy(buffer, bytes.data() + m_position, read);
        m_position += read;
        return read;
    }
    void Truncate(int64_t size) override { bytes.resize(static_cast<size_t>(size)); }

private:
    int64_t m_position = 0;
};

inline std::string int64Bytes(int64_t value) {
    return {reinterpret_cast<const char*>(&value), sizeof value};
}

inline std::string chunk(const std::string& id, const std::string& body) {
    return id + int64Bytes(static_cast<int64_t>(body.size())) + body;
}

inline std::string chunkFile(const std::string& chunks, const std::string& signature = "TESTFILE") {
    return signature + int64Bytes(static_cast<int64_t>(chunks.size())) + chunks;
}

} // namespace tests
