// The list of descriptive texts of a WAVE file.
#pragma once

#include "filetag/Api.h"
#include "filetag/rifftag/Chunks.h"

#include <string>
#include <string_view>
#include <vector>

namespace filetag::rifftag {

// A LIST chunk of type INFO in the form that it has in files: "LIST", its size, "INFO", then the entries,
// each an id, a size and so many bytes. Entries of odd size are written without a pad byte behind them. Other
// programs write one; as no id begins with a zero, zeros behind an entry are passed over and go with it.
class FILETAG_API CInfoList {
public:
    CInfoList(); // without entries
    // The chunk as it was read, with its header of 12 bytes. Sizes in it may be anything.
    explicit CInfoList(std::vector<uint8_t> chunk);

    // Up to the terminating zero; empty when there is no such entry.
    std::string_view get(const FourCC& id) const;
    // Replaces the first entry of that id, or appends one. The value is written with a terminating zero.
    void set(const FourCC& id, std::string_view value);
    // The chunk for the file, its size set right.
    const std::vector<uint8_t>& getChunk();

private:
    struct SEntry {
        size_t offset; // of its header
        size_t size;   // of the value, as far as the list holds it
        size_t end;    // where the next one begins
    };

    // The entry that begins at the offset; false when no header is left there.
    bool getEntry(size_t offset, SEntry& entry) const;
    bool find(const FourCC& id, SEntry& entry) const;
    // Makes what stands at the end of the list an entry that ends there, so that another may follow.
    void closeEnd();
    void setSize(size_t offset, size_t size); // of the chunk or entry whose header stands there

    std::vector<uint8_t> m_chunk;
};

} // namespace filetag::rifftag
