// The content of a file being edited, as ranges of the old file and new bytes.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>

namespace filetag::taglib {

// Only the new bytes are held in memory. Overwriting costs O(log pieces), because every page header of an Ogg
// file may be rewritten that way; an operation that moves the bytes behind it costs O(pieces).
class CPieceTable {
public:
    struct SPiece {
        int64_t size;
        int64_t source; // offset in the old file or in the new bytes
        bool isNew;
    };
    using Map = std::map<int64_t, SPiece>; // by position; no gaps, no empty pieces

    explicit CPieceTable(int64_t oldSize);

    int64_t getSize() const { return m_size; }
    bool isChanged() const { return m_changed; }
    const Map& getPieces() const { return m_pieces; }
    // The piece that contains the position, or end().
    Map::const_iterator find(int64_t position) const;
    std::string_view getBytes(const SPiece& piece) const; // the piece must be new

    // Overwrites bytes and extends the content if necessary; a gap before the position is filled with zeros.
    void write(int64_t position, std::string_view bytes);
    // Replaces `replaced` bytes, or as many as there are before the end, with the given ones.
    void insert(int64_t position, std::string_view bytes, int64_t replaced);
    void setSize(int64_t size); // truncates, or extends with zeros

private:
    Map::iterator split(int64_t position); // returns the piece that then starts there
    void erase(int64_t position, int64_t size);
    void enter(int64_t position, std::string_view bytes);
    void moveTail(int64_t position, int64_t distance);

    int64_t m_size;
    bool m_changed = false;
    Map m_pieces;
    std::string m_new; // append-only
};

} // namespace filetag::taglib
