// Decoded and scaled pictures that are kept to be painted again.
#pragma once

#include "graphics/images/Bitmap.h"

#include <compare>
#include <list>
#include <map>

namespace graphics {

// Releases the pictures that were used least recently when their bytes exceed getImageMemory(). A picture
// that is larger than the limit is not kept at all. Interface thread only.
class GRAPHICS_API CBitmapCache {
public:
    struct SKey {
        const CBitmap* bitmap;
        int width;
        int height;

        auto operator<=>(const SKey&) const = default;
    };

    // Null if there is no such picture.
    CPixels::Image Find(const SKey& key);
    void Add(const SKey& key, CPixels::Image image);
    void Drop(const CBitmap* bitmap);
    // Releases the bitmap's pictures of other sizes.
    void DropOthers(const SKey& key);
    // Of all pictures. Those that a painter still holds after they were released do not count.
    int64_t GetBytes() const { return m_bytes; }

private:
    struct SEntry {
        SKey key;
        CPixels::Image image;
    };
    using Entries = std::list<SEntry>;

    void remove(std::map<SKey, Entries::iterator>::iterator found);

    Entries m_entries; // the one that was used last is the first
    std::map<SKey, Entries::iterator> m_byKey;
    int64_t m_bytes = 0;
};

GRAPHICS_API CBitmapCache& getBitmapCache();

} // namespace graphics
