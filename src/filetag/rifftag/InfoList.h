// The LIST/INFO chunk of a WAVE file.
#pragma once

#include "filetag/Api.h"
#include "filetag/rifftag/Chunks.h"

#include <string>
#include <string_view>
#include <vector>

namespace filetag::rifftag {

// A LIST chunk of type INFO as it is stored in files: "LIST", its size, "INFO", then the entries, each with
// an id, a size and that many bytes. Entries of odd size are written without a pad byte. Other programs write
// one; because no id starts with a zero byte, zeros behind an entry are skipped and count as part of it.
class FILETAG_API CInfoList {
public:
    CInfoList(); // without entries
    // Takes the chunk as read, including its 12-byte header. The sizes in it need not be valid.
    explicit CInfoList(std::vector<uint8_t> chunk);

    // The value up to its terminating zero; empty if there is no such entry.
    std::string_view get(const FourCC& id) const;
    // Replaces the first entry with this id or appends a new one. Adds a terminating zero to the value.
    void set(const FourCC& id, std::string_view value);
    int64_t getSize() const { return static_cast<int64_t>(m_chunk.size()); } // in memory, with the header
    // The chunk to be written. Most programs stop reading at an entry of odd size without a pad byte, so
    // these come last, unless all of them are to be padded. An entry that was read with a pad byte is written
    // with one.
    std::vector<uint8_t> render(bool padded) const;

private:
    struct SEntry {
        size_t offset; // of its header
        size_t size;   // of the value, limited to the end of the list
        size_t end;    // start of the next entry
    };

    // Reads the entry at the offset. Returns false if there is no room for a header.
    bool getEntry(size_t offset, SEntry& entry) const;
    bool find(const FourCC& id, SEntry& entry) const;
    FourCC readId(size_t offset) const;
    // Corrects the size of a cut last entry and drops trailing garbage, so that an entry can be appended.
    void closeEnd();
    void setSize(size_t offset, size_t size); // in the chunk or entry header at the offset

    std::vector<uint8_t> m_chunk;
};

} // namespace filetag::rifftag
