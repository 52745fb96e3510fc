// What a sound file says of itself, and what an output file must not do.
#pragma once

#include <filesystem>
#include <string>

namespace host {

struct SSampleFormat {
    int rate = 44100;
    int channels = 2;
    int bytesPerSample = 2;

    bool operator==(const SSampleFormat&) const = default;
};

// The file's own format, by its headers; 44100 Hz, 2 channels and 16 bits where they do not tell.
SSampleFormat readSampleFormat(const std::filesystem::path& file);

// "44100 Hz, 2 channels and 16 bits"
std::string describe(const SSampleFormat& samples);

// Throws std::runtime_error with the reason when this is no regular file with something in it.
void checkInput(const std::filesystem::path& file);

// ".xyz files", as a part of a message.
std::string describeKind(const std::filesystem::path& file);

// Says what the codec of an extension is called.
std::string codecName(const std::filesystem::path& file);

// A file that appears complete or not at all: it is written under a temporary name beside its place.
class COutputPlace {
public:
    // Throws std::runtime_error when the target exists and is not to be replaced, or cannot be replaced;
    // likewise for a file of the temporary name, which an earlier run has left. Links are followed.
    COutputPlace(const std::filesystem::path& target, const std::string& temporaryEnding, bool replace);
    COutputPlace(const COutputPlace&) = delete;
    COutputPlace& operator=(const COutputPlace&) = delete;
    ~COutputPlace(); // removes the temporary file, unless committed or kept

    const std::filesystem::path& getTemporary() const { return m_temporary; }
    // Makes the file durable and gives it its name; what was there before keeps its mode. Throws.
    void commit();
    // Leaves the file under its temporary name.
    void keep() { m_committed = true; }

private:
    std::filesystem::path m_target;
    std::filesystem::path m_temporary;
    bool m_replace;
    bool m_committed = false;
};

bool isSameFile(const std::filesystem::path& a, const std::filesystem::path& b);

} // namespace host
