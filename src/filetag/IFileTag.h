// The descriptive fields of one audio file.
#pragma once

#include "filetag/Api.h"
#include "peru/uri/IURI.h"

namespace filetag {

using peru::P;

// Objects are created closed. Setters change only the object; the file changes on store(). All fields are
// texts in every tag system, including track number and year: nothing is parsed or checked. A field that is
// missing, or that the tag system does not support, reads as the empty text; setting the empty text removes a
// field. Only one thread may use an object at a time.
class FILETAG_API IFileTag : public virtual peru::IBase {
public:
    virtual bool isOpened() const = 0;
    // Reads the file's tag. Throws CFileError: CFileNotFoundError, CFileAccessDeniedError, and
    // CFileFormatNotSupportedError for content that does not fit the file's extension.
    virtual void open() = 0;
    virtual void close() = 0; // discards changes that were not stored
    virtual P<peru::IURI> getURI() const = 0;
    // Writes the changes to the file. On success the file is completely new; on an error, which is thrown as
    // CFileError, the old file is unchanged. Copies the file if the length of the tag changes. After a store
    // the tag must be opened again before the next one.
    virtual void store() = 0;

    virtual void setTitle(const peru::CStringArg& title) = 0;
    virtual P<peru::IString> getTitle() const = 0;
    virtual void setArtist(const peru::CStringArg& artist) = 0;
    virtual P<peru::IString> getArtist() const = 0;
    virtual void setAlbum(const peru::CStringArg& album) = 0;
    virtual P<peru::IString> getAlbum() const = 0;
    virtual void setAlbumArtist(const peru::CStringArg& artist) = 0;
    virtual P<peru::IString> getAlbumArtist() const = 0;
    virtual void setTrackNumber(const peru::CStringArg& number) = 0;
    virtual P<peru::IString> getTrackNumber() const = 0;
    virtual void setYear(const peru::CStringArg& year) = 0;
    virtual P<peru::IString> getYear() const = 0;
    virtual void setGenre(const peru::CStringArg& genre) = 0;
    virtual P<peru::IString> getGenre() const = 0;
    virtual void setComment(const peru::CStringArg& comment) = 0;
    virtual P<peru::IString> getComment() const = 0;
    // The kind of tag in the file, such as "ID3v2.3"; empty for a file without a tag.
    virtual P<peru::IString> getTagType() const = 0;
};

} // namespace filetag
