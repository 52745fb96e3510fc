// The descriptive fields of one audio file.
#pragma once

#include "filetag/Api.h"
#include "peru/uri/IURI.h"

namespace filetag {

using peru::P;

// Made closed. Setters change the object only; the file changes at store. All fields are texts in every tag
// system, track number and year too: nothing is parsed or checked. A field that is absent, and one that the
// tag system does not have, reads as the empty text; setting the empty text removes a field. One thread at a
// time.
class FILETAG_API IFileTag : public virtual peru::IBase {
public:
    virtual bool isOpened() const = 0;
    // Reads the file's tag. Throws CFileError: CFileNotFoundError, CFileAccessDeniedError, and
    // CFileFormatNotSupportedError for content that does not fit the file's extension.
    virtual void open() = 0;
    virtual void close() = 0; // changes that were not stored are lost
    virtual P<peru::IURI> getURI() const = 0;
    // Writes the changes: afterwards the file is the new one, whole, or after an error, which is thrown as
    // CFileError, the old one as it was. Costs a copy of the file where the tag's length in it changes.
    // Needs an open before the next store.
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
    // What kind of tag the file has, such as "ID3v2.3"; empty for a file without one.
    virtual P<peru::IString> getTagType() const = 0;
};

} // namespace filetag
