// Appends the sectors of an image in order.
#pragma once

#include "ImageLayout.h"

namespace discio {

class CLayoutBuilder {
public:
    // Opens a file once, whatever the number of its uses. Throws CDiscError.
    int openFile(const std::string& path);
    const CImageFile& getFile(int file) const { return *m_layout.files[static_cast<size_t>(file)]; }

    int32_t getNext() const { return m_next; } // the block that is appended next
    // Does nothing for a count of 0. Throws CDiscError beyond the length of the largest disc.
    void append(ESectorForm form, int32_t count, int file = -1, int64_t offset = 0, int64_t bytes = 0);

    STableOfContents& getContents() { return m_layout.contents; }
    // Sets the lengths of the tracks and the lead-out.
    SImageLayout finish();

private:
    SImageLayout m_layout;
    int32_t m_next = 0;
};

} // namespace discio
