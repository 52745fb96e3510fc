// The file that a plug-in reads or writes, and its audio format.
#pragma once

#include "peru/strings/LocalizedFormat.h"
#include "peru/uri/IURI.h"
#include "sonora2/context/SonoraError.h"

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

namespace sonora2::plugins {

using peru::P;

// Interleaved PCM as in chunks: 8 bit unsigned, 16, 24 and 32 bit signed little-endian, or floating point.
struct SPcmFormat {
    int rate = 0; // frames per second
    int channels = 0;
    int bytesPerSample = 0;
    bool isFloat = false; // numbers of 4 or 8 bytes, see IFloatSamples

    int frameBytes() const { return channels * bytesPerSample; }
    bool operator==(const SPcmFormat&) const = default;
};

struct SMediaFile {
    P<peru::IURI> uri;
    std::string path; // platform path in bytes; empty unless the URI is a local file

    explicit SMediaFile(const P<peru::IURI>& uri);

    // Returns the one of the known extensions (lower case) that the file's name has. Since jobs may write to
    // temporary names, unknown suffixes are skipped ("x.aiff.part", "x.aiffpart"). Returns the first known
    // extension if none matches.
    std::string getExtension(const std::vector<std::string>& known) const;

    P<peru::IString> getDisplayName() const; // for messages
};

struct SFileCloser {
    void operator()(std::FILE* file) const { std::fclose(file); }
};
using InputFile = std::unique_ptr<std::FILE, SFileCloser>;
// Opens a regular file for a codec library, which uses the stream or its descriptor. Throws CSonoraError.
InputFile openForReading(const SMediaFile& file);
// Distinguishes a file from one that has replaced it under the same name.
struct SFileIdentity {
    uint64_t device = 0;
    uint64_t node = 0;
    int64_t size = -1;
    int64_t seconds = 0; // of the last change
    int64_t nanoseconds = 0;
    bool operator==(const SFileIdentity&) const = default;
};
SFileIdentity identify(const InputFile& file);
bool isPipe(const SMediaFile& file);
// Opens a named pipe whose other end is open already; otherwise it has no content.
InputFile openPipe(const SMediaFile& file);

// Throws CSonoraError; `text` is a format of CStringFormat.
template <class... Args> [[noreturn]] void fail(const peru::SLocalizedText& text, const Args&... args) {
    throw common::CSonoraError(peru::format(text, args...));
}
// The same for text that is not translated.
template <class... Args> [[noreturn]] void fail(const char* text, const Args&... args) {
    throw common::CSonoraError(peru::format(text, args...));
}
// The same for a failed call of the system. The text's fields are the file and the reason.
[[noreturn]] void failSystem(const peru::SLocalizedText& text, const SMediaFile& file, int errorNumber);
// The same without a translation: `doing` is a phrase such as "could not open".
[[noreturn]] void failSystem(const char* doing, const SMediaFile& file, int errorNumber);

} // namespace sonora2::plugins
