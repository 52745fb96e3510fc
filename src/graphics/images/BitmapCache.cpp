#include "graphics/images/BitmapCache.h"

#include <climits>

namespace graphics {

namespace {

int64_t countBytes(const CPixels::Image& image) {
    return static_cast<int64_t>(image->getPixels().size() * sizeof(uint32_t));
}

} // namespace

CPixels::Image CBitmapCache::Find(const SKey& key) {
    const auto found = m_byKey.find(key);
    if (found == m_byKey.end()) return {};
    m_entries.splice(m_entries.begin(), m_entries, found->second);
    return found->second->image;
}

void CBitmapCache::Add(const SKey& key, CPixels::Image image) {
    const int64_t limit = peru::gui::getImageMemory(), bytes = countBytes(image);
    if (const auto found = m_byKey.find(key); found != m_byKey.end()) remove(found);
    if (bytes <= limit) {
        m_entries.push_front({key, std::move(image)});
        m_byKey[key] = m_entries.begin();
        m_bytes += bytes;
    }
    while (m_bytes > limit) remove(m_byKey.find(m_entries.back().key));
}

void CBitmapCache::Drop(const CBitmap* bitmap) {
    DropOthers({bitmap, INT_MIN, INT_MIN});
}

void CBitmapCache::DropOthers(const SKey& key) {
    for (auto at = m_byKey.lower_bound({key.bitmap, INT_MIN, INT_MIN});
         at != m_byKey.end() && at->first.bitmap == key.bitmap;) {
        const auto next = std::next(at);
        if (at->first != key) remove(at);
        at = next;
    }
}

void CBitmapCache::remove(std::map<SKey, Entries::iterator>::iterator found) {
    m_bytes -= countBytes(found->second->image);
    m_entries.erase(found->second);
    m_byKey.erase(found);
}

CBitmapCache& getBitmapCache() {
    static CBitmapCache s_cache;
    return s_cache;
}

} // namespace graphics
