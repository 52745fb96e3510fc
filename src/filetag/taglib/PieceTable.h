// A file's content under work: what stays of the old file, and what is new.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>

namespace filetag::taglib {

// Holds the new bytes only. Overwriting costs O(log pieces), since whole files of page headers are rewritten
// by that; whatever moves the bytes behind it costs O(pieces).
class CPieceTable {
public:
    struct SPiece {
        int64_t size;
        int64_t source; // offset in the old file, or among the new bytes
        bool isNew;
    };
    using Map = std::map<int64_t, SPiece>; // by position; without holes, no piece is empty

    explicit CPieceTable(int64_t oldSize);

    int64_t getSize() const { return m_size; }
    bool isChanged() const { return m_changed; }
    const Map& getPieces() const { return m_pieces; }
    // The piece that holds the position, or the end.
    Map::const_iterator find(int64_t position) const;
    std::string_view getBytes(const SPiece& piece) const; // of a new one

    // Overwrites and extends; a gap before the position is filled with zeros.
    void write(int64_t position, std::string_view bytes);
    // Puts the bytes in the place of `replaced` ones, fewer at the end.
    void insert(int64_t position, std::string_view bytes, int64_t replaced);
    void setSize(int64_t size); // cuts or extends with zeros

private:
    Map::iterator split(int64_t position); // the piece that starts there
    void erase(int64_t position, int64_t size);
    void enter(int64_t position, std::string_view bytes);
    void moveTail(int64_t position, int64_t distance);

    int64_t m_size;
    bool m_changed = false;
    Map m_pieces;
    std::string m_new; // only grows
};

} // namespace filetag::taglib
