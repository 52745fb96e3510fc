#include "LayoutBuilder.h"

#include <algorithm>

namespace discio {

namespace {

constexpr int32_t kMaxBlocks = 64 * 1024 * 1024; // 128 GB of data, more than any disc

} // namespace

int CLayoutBuilder::openFile(const std::string& path) {
    auto& files = m_layout.files;
    const auto found =
        std::find_if(files.begin(), files.end(), [&](const auto& file) { return file->getPath() == path; });
    if (found != files.end()) return static_cast<int>(found - files.begin());
    files.push_back(std::make_unique<CImageFile>(path));
    return static_cast<int>(files.size()) - 1;
}

void CLayoutBuilder::append(ESectorForm form, int32_t count, int file, int64_t offset, int64_t bytes) {
    if (count == 0) return;
    if (count < 0 || count > kMaxBlocks - m_next)
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, "the image is larger than any disc");
    m_layout.extents.push_back({m_next, count, form, file, offset, bytes});
    m_next += count;
}

SImageLayout CLayoutBuilder::finish() {
    STableOfContents& contents = m_layout.contents;
    contents.leadOut = m_next;
    for (size_t i = 0; i < contents.tracks.size(); ++i) {
        STrack& track = contents.tracks[i];
        const bool isLast = i + 1 == contents.tracks.size();
        const int32_t end = isLast ? m_next : contents.tracks[i + 1].start - contents.tracks[i + 1].pregap;
        track.length = end - track.start;
    }
    return std::move(m_layout);
}

} // namespace discio
