// Output for signal handlers: no allocation, no locale, no stdio.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace crashhandler {

// A file that is written sequentially; writeAt overwrites earlier bytes. After a failure all further writes
// do nothing.
class CSafeWriter {
public:
    // Replaces an existing file; only the user has access to the new one. Fails for anything but a regular
    // file.
    explicit CSafeWriter(const char* path);
    // Takes over an open file.
    explicit CSafeWriter(int file) : m_file(file) {}
    ~CSafeWriter();
    CSafeWriter(const CSafeWriter&) = delete;
    CSafeWriter& operator=(const CSafeWriter&) = delete;

    bool isGood() const { return m_file >= 0; }
    uint32_t getPosition() const { return m_position; }

    void write(const void* data, size_t size);
    void writeAt(uint32_t position, const void* data, size_t size);
    // Copies memory of this process that may be unreadable; unreadable pages become zeros.
    void writeMemory(uintptr_t address, size_t size);
    // The whole content of a file, such as one below /proc.
    void writeFile(const char* path);

    void text(std::string_view text) { write(text.data(), text.size()); }
    void number(uint64_t value, int base = 10);

private:
    void fail();

    int m_file;
    uint32_t m_position = 0;
};

} // namespace crashhandler
