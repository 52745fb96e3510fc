#include "filetag/taglib/TagLibTag.h"

#include "filetag/taglib/Texts.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <utility>

namespace filetag::taglib {

using namespace peru;

void CTagLibTag::open() {
    openWith(posix::EAccess::shared);
}

void CTagLibTag::openWith(posix::EAccess access) {
    close();
    auto stream = std::make_unique<CTagLibIOStream>(m_uri, access);
    std::unique_ptr<TagLib::File> file = openFile(*stream);
    if (!file) throw CFileFormatNotSupportedError(m_uri);
    m_stream = std::move(stream);
    m_file = std::move(file);
}

void CTagLibTag::close() {
    ++m_generation;
    dropTags();
    m_file.reset();
    m_stream.reset();
    m_texts.clear();
    m_picturesChanged = false;
}

void CTagLibTag::store() {
    if (!m_stream)
        throw CFileError(localize("filetag.CTagLibTag.NotOpened", "The tag of '%FILE%' is not open.",
                                  {{"%FILE%", getShownName(m_uri)}}),
                         m_uri);
    const std::map<EField, TagLib::String> texts = std::exchange(m_texts, {});
    const bool picturesChanged = std::exchange(m_picturesChanged, false);
    // Without this check TagLib would still upgrade the tag to its newest version.
    if (texts.empty() && !picturesChanged) return m_stream.reset();
    try {
        return write(!picturesChanged);
    } catch (const posix::CFileChangedError&) {
        if (picturesChanged) throw;
    }
    for (int attempt = 1;; ++attempt) {
        openWith(posix::EAccess::exclusive);
        for (const auto& [field, text] : texts) writeField(field, text);
        try {
            return write(true);
        } catch (const posix::CFileChangedError&) {
            if (attempt == posix::kAttempts) throw;
        }
    }
}

// The stream is released in any case: after an error the objects no longer match the file.
void CTagLibTag::write(bool certain) {
    const std::unique_ptr<CTagLibIOStream> stream = std::move(m_stream);
    if (!save(*m_file, *stream))
        throw CFileError(localize("filetag.CTagLibTag.StoreError", "The tag of '%FILE%' could not be stored.",
                                  {{"%FILE%", getShownName(m_uri)}}),
                         m_uri);
    stream->commit(certain);
}

void CTagLibTag::set(EField field, const CStringArg& text) {
    if (!m_file) return;
    m_texts[field] = toTagText(text);
    writeField(field, m_texts[field]);
}

P<IString> CTagLibTag::get(EField field) const {
    return m_file ? fromTagText(readField(field)) : CString::empty();
}

void CTagLibTag::replaceCoverArt(int32_t index, const P<CMemoryBlock>& data, const CStringArg& mimeType,
                                 EPictureType type) {
    const P<ICoverArt> picture = getCoverArt(index);
    if (!picture) return;
    picture->setData(data);
    picture->setMimeType(mimeType);
    picture->setPictureType(type);
}

} // namespace filetag::taglib
