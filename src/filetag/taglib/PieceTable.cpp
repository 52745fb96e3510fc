#include "filetag/taglib/PieceTable.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace filetag::taglib {

CPieceTable::CPieceTable(int64_t oldSize) : m_size(oldSize) {
    if (oldSize > 0) m_pieces.emplace(0, SPiece{oldSize, 0, false});
}

CPieceTable::Map::const_iterator CPieceTable::find(int64_t position) const {
    if (position < 0 || position >= m_size) return m_pieces.end();
    return std::prev(m_pieces.upper_bound(position));
}

std::string_view CPieceTable::getBytes(const SPiece& piece) const {
    return std::string_view(m_new).substr(static_cast<size_t>(piece.source), static_cast<size_t>(piece.size));
}

CPieceTable::Map::iterator CPieceTable::split(int64_t position) {
    if (position >= m_size) return m_pieces.end();
    const Map::iterator piece = std::prev(m_pieces.upper_bound(position));
    const int64_t head = position - piece->first;
    if (head == 0) return piece;
    const SPiece tail{piece->second.size - head, piece->second.source + head, piece->second.isNew};
    piece->second.size = head;
    return m_pieces.emplace_hint(std::next(piece), position, tail);
}

void CPieceTable::erase(int64_t position, int64_t size) {
    const Map::iterator first = split(position);
    // The second split may divide the same piece, but `first` still refers to the part that starts here.
    m_pieces.erase(first, split(position + size));
}

void CPieceTable::enter(int64_t position, std::string_view bytes) {
    if (bytes.empty()) return;
    m_pieces.emplace(position,
                     SPiece{static_cast<int64_t>(bytes.size()), static_cast<int64_t>(m_new.size()), true});
    m_new.append(bytes);
}

void CPieceTable::moveTail(int64_t position, int64_t distance) {
    if (distance == 0) return;
    std::vector<Map::value_type> tail(m_pieces.lower_bound(position), m_pieces.end());
    m_pieces.erase(m_pieces.lower_bound(position), m_pieces.end());
    for (const auto& [start, piece] : tail) m_pieces.emplace_hint(m_pieces.end(), start + distance, piece);
}

void CPieceTable::write(int64_t position, std::string_view bytes) {
    if (bytes.empty()) return;
    m_changed = true;
    if (position > m_size) setSize(position);
    const auto size = static_cast<int64_t>(bytes.size());
    erase(position, size);
    enter(position, bytes);
    m_size = std::max(m_size, position + size);
}

void CPieceTable::insert(int64_t position, std::string_view bytes, int64_t replaced) {
    if (position > m_size) setSize(position);
    replaced = std::clamp<int64_t>(replaced, 0, m_size - position);
    if (bytes.empty() && replaced == 0) return;
    m_changed = true;
    const auto size = static_cast<int64_t>(bytes.size());
    split(position);
    erase(position, replaced);
    moveTail(position + replaced, size - replaced);
    enter(position, bytes);
    m_size += size - replaced;
}

void CPieceTable::setSize(int64_t size) {
    if (size == m_size) return;
    m_changed = true;
    if (size < m_size)
        m_pieces.erase(split(size), m_pieces.end());
    else
        enter(m_size, std::string(static_cast<size_t>(size - m_size), '\0'));
    m_size = size;
}

} // namespace filetag::taglib
