// All fields and pictures of a file's tag, and copying them from one file to another.
#pragma once

#include "filetag/ICoverArt.h"
#include "peru/uri/IURI.h"

#include <vector>

namespace filetag {

// Keys are upper case and independent of the format: TITLE, ARTIST, ALBUMARTIST, TRACKNUMBER, DATE, COMPOSER,
// LYRICS, REPLAYGAIN_TRACK_GAIN, MUSICBRAINZ_TRACKID and so on. A key that a format does not define is stored
// under its own name where the format allows that.
struct STagField {
    P<peru::IString> key;
    std::vector<P<peru::IString>> values;
};

struct STagPicture {
    P<peru::CMemoryBlock> data; // the bytes of the picture file
    P<peru::IString> mimeType;
    P<peru::IString> description;
    int32_t fileType = 0; // the number of the ID3v2 APIC frame: 3 is the front cover, 4 the back cover
    // In pixels and bits per pixel; 0 if unknown. Colors are counted for indexed pictures only.
    int32_t width = 0;
    int32_t height = 0;
    int32_t colorDepth = 0;
    int32_t colorCount = 0;
};

struct STags {
    std::vector<STagField> fields; // sorted by key
    std::vector<STagPicture> pictures;
    // Names, in the file's own terms, of what has no place in the lists above, such as "PRIV".
    std::vector<P<peru::IString>> others;
};

// A change of some fields and pictures; the others stay.
struct STagChange {
    std::vector<STagField>
        fields; // replace those of the same key, in any case; without values they are removed
    std::vector<int32_t> removedPictures; // by `fileType`
    bool removesAllPictures = false;
    std::vector<STagPicture> addedPictures; // become the first ones
};

// What the target's format could not hold, or holds in a shortened form.
struct STransferReport {
    std::vector<P<peru::IString>> lostFields;
    std::vector<STagPicture> lostPictures;
    bool isComplete() const { return lostFields.empty() && lostPictures.empty(); }
};

// All functions accept every format with tags, whatever the extension: besides those of CFileTagFactory also
// Opus, Speex, MP4, AIFF, APE, WavPack, Musepack and True Audio. They throw CFileError: CFileNotFoundError,
// CFileAccessDeniedError, and CFileFormatNotSupportedError for other content. A file is replaced as by
// IFileTag::store: after an error it is unchanged. Functions may be called from any thread. They read and
// write under a lock, so that changes that several threads or processes make to one file are all kept.

FILETAG_API STags readAllTags(const P<peru::IURI>& file);

// Replaces all fields and pictures; whatever `others` names stays in the file.
FILETAG_API STransferReport writeAllTags(const P<peru::IURI>& file, const STags& tags);

// Returns false if the file is like that already; it is then not written. Throws CFileError if the format
// cannot hold the new fields and pictures, or cannot keep the others.
FILETAG_API bool changeTags(const P<peru::IURI>& file, const STagChange& change);

// Sets one field, or removes it if there are no values. Throws CFileError if the format cannot hold them.
FILETAG_API void setTagField(const P<peru::IURI>& file, const peru::CStringArg& key,
                             const std::vector<P<peru::IString>>& values);

// Replaces all pictures. Returns those that the format cannot hold.
FILETAG_API std::vector<STagPicture> setTagPictures(const P<peru::IURI>& file,
                                                    const std::vector<STagPicture>& pictures);

// Adds fields and pictures to those of the file. Fields of the same key are replaced; fields that describe
// the encoding of another file, such as its encoder, are left out.
FILETAG_API STransferReport addTags(const P<peru::IURI>& file, const STags& tags);

// Adds all fields and pictures of one file to another.
FILETAG_API STransferReport transferTags(const P<peru::IURI>& source, const P<peru::IURI>& target);

} // namespace filetag
