// The commands of the program. Each returns an exit code.
#pragma once

#include "Library.h"
#include "Progress.h"

#include <functional>
#include <map>
#include <optional>

namespace host {

struct SFormatOptions {
    std::optional<int> rate;
    std::optional<int> channels;
    std::optional<int> bits;
    std::optional<double> quality; // 0.0 to 1.0
    int bitRate = 0;               // bits per second
    int minBitRate = 0;
    int maxBitRate = 0;
};

struct SConvertOptions : SFormatOptions {
    std::vector<std::filesystem::path> inputs;
    std::filesystem::path output;    // for a single input
    std::string extension;           // or one output beside each input
    std::filesystem::path directory; // ... or in this folder
    int jobs = 1;
    bool force = false;
    bool carryTags = true;
    bool salvage = false;
    std::string resampler; // "default" or "best"; empty: as the environment says
    EOutput show = EOutput::normal;
};

struct SWaveformOptions {
    std::filesystem::path input;
    std::filesystem::path output;
    int width = 1200;
    int height = 300;
    bool force = false;
};

struct SPlayOptions {
    std::vector<std::filesystem::path> files;
    EOutput show = EOutput::normal;
};

struct SMixOptions : SFormatOptions {
    std::filesystem::path input;
    std::filesystem::path output;
    bool force = false;
    EOutput show = EOutput::normal;
};

struct SRecordOptions : SFormatOptions {
    std::filesystem::path output;
    std::string device; // its id; empty for the default device
    double seconds = 0; // 0: until stopped
    bool force = false;
    EOutput show = EOutput::normal;
};

struct SSetTagOptions {
    std::vector<std::filesystem::path> files;
    std::map<std::string, std::u16string> fields; // by name; an empty text removes the field
    bool json = false;
};

int convert(CLibrary& library, const SConvertOptions& options);
int showInfo(CLibrary& library, const std::vector<std::filesystem::path>& files, bool json);
int listFormats(CLibrary& library, bool json);
int drawWaveform(CLibrary& library, const SWaveformOptions& options);
int listDevices(bool json);
int play(CLibrary& library, const SPlayOptions& options);
int mix(CLibrary& library, const SMixOptions& options);
int record(CLibrary& library, const SRecordOptions& options);
int showTags(CLibrary& library, const std::vector<std::filesystem::path>& files, bool json);
int setTags(CLibrary& library, const SSetTagOptions& options);

// Runs the job for each file; the job throws on failure, which is reported and does not stop the others. With
// EReader::needed the loop ends when the reader of standard output has closed it.
enum class EReader { needed, optional };
int forEachFile(const std::vector<std::filesystem::path>& files, bool json, EReader reader,
                const std::function<void(const std::filesystem::path&)>& job);

// "tonewright: FILE: REASON" on standard error.
void printFailure(const std::filesystem::path& file, const std::string& reason);

} // namespace host
