// Where the sectors of a disc image are in its files. The readers of the formats produce it.
#pragma once

#include "Medium.h"

#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace discio {

// A file of an image. Any thread.
class CImageFile {
public:
    explicit CImageFile(const std::string& path); // throws CDiscError
    ~CImageFile();
    CImageFile(const CImageFile&) = delete;
    CImageFile& operator=(const CImageFile&) = delete;

    const std::string& getPath() const { return m_path; }
    int64_t getSize() const { return m_size; }
    // Reads up to `size` bytes; fewer only at the end of the file. Throws CDiscError, also if the file has
    // been exchanged or changed since it was opened.
    size_t read(int64_t offset, void* data, size_t size) const;
    // Throws CDiscError if it is larger than `limit`.
    std::string readAll(size_t limit) const;

private:
    void requireUnchanged() const;

    std::string m_path;
    int m_file = -1;
    int64_t m_size = 0;
    int64_t m_changed = 0; // nanoseconds
};

enum class ESectorForm {
    silence,       // not in any file
    audio,         // 2352 bytes, little-endian
    audioSwapped,  // 2352 bytes, big-endian
    data,          // 2048 bytes
    raw,           // 2352 bytes with header
    withSubheader, // 2336 bytes
    audioWithSub,  // 2448 bytes: audio and 96 bytes of subchannel
    rawWithSub,    // 2448 bytes
};
int getSectorBytes(ESectorForm form);
bool isAudioForm(ESectorForm form);

// Consecutive blocks in one form.
struct SExtent {
    int32_t start = 0;
    int32_t count = 0;
    ESectorForm form = ESectorForm::silence;
    int file = -1;
    int64_t offset = 0; // of the first block in the file
    int64_t bytes = 0;  // available there; what is missing in the last sector is silence
};

struct SImageLayout {
    STableOfContents contents;
    std::vector<SExtent> extents; // in order of their blocks
    std::vector<std::unique_ptr<CImageFile>> files;
};

// By the file's extension: .cue, .iso, .nrg and .toc. Throws CDiscError.
SImageLayout readImage(const std::string& path);
bool isImageName(const std::string& name);

// The readers of the formats. All throw CDiscError.
SImageLayout readCueImage(const std::string& path);
SImageLayout readTocImage(const std::string& path);
SImageLayout readNrgImage(const std::string& path);
SImageLayout readIsoImage(const std::string& path);

// Throws CDiscError for a layout whose tracks are not in order or not covered by sectors.
void checkLayout(const SImageLayout& layout, const std::string& path);

// The samples in a WAV file: offset and bytes of its data. Throws CDiscError unless it is 44100 Hz, 16 bits,
// stereo PCM.
struct SWaveData {
    int64_t offset = 0;
    int64_t bytes = 0;
};
SWaveData findWaveData(const CImageFile& file);

// Text of a sheet: UTF-8 as it is, without its byte order mark; otherwise taken as Latin-1.
std::string toUTF8Text(std::string_view bytes);
// A name in a sheet, relative to the sheet's folder. Names with backslashes, and absolute ones that do not
// exist, are looked up by their last part beside the sheet.
std::string resolveName(const std::string& sheet, const std::string& name);
// "MM:SS:FF" to blocks; -1 if it is not a time.
int32_t parseTime(std::string_view text);

} // namespace discio
