// Common base of the tags that use TagLib.
#pragma once

#include "filetag/ICoverArtFileTag.h"
#include "filetag/taglib/TagLibIOStream.h"
#include "peru/Object.h"

#include <tfile.h>

#include <map>
#include <memory>

namespace filetag::taglib {

enum class EField { title, artist, album, albumArtist, trackNumber, year, genre, comment };

// A derived class maps fields and pictures to its format and calls close() in its destructor. Before open(),
// and for a file without a tag, all fields are empty and there are no pictures.
class CTagLibTag : public peru::CObject, public ICoverArtFileTag {
public:
    bool isOpened() const override { return m_file != nullptr; }
    void open() override;
    void close() override;
    P<peru::IURI> getURI() const override { return m_uri; }
    // If another program has changed the file since it was opened, the texts that were set are set in its new
    // content, and it is opened anew. Pictures are not, since they might be other ones: with changed pictures
    // the store fails.
    void store() override;

    void setTitle(const peru::CStringArg& title) override { set(EField::title, title); }
    P<peru::IString> getTitle() const override { return get(EField::title); }
    void setArtist(const peru::CStringArg& artist) override { set(EField::artist, artist); }
    P<peru::IString> getArtist() const override { return get(EField::artist); }
    void setAlbum(const peru::CStringArg& album) override { set(EField::album, album); }
    P<peru::IString> getAlbum() const override { return get(EField::album); }
    void setAlbumArtist(const peru::CStringArg& artist) override { set(EField::albumArtist, artist); }
    P<peru::IString> getAlbumArtist() const override { return get(EField::albumArtist); }
    void setTrackNumber(const peru::CStringArg& number) override { set(EField::trackNumber, number); }
    P<peru::IString> getTrackNumber() const override { return get(EField::trackNumber); }
    void setYear(const peru::CStringArg& year) override { set(EField::year, year); }
    P<peru::IString> getYear() const override { return get(EField::year); }
    void setGenre(const peru::CStringArg& genre) override { set(EField::genre, genre); }
    P<peru::IString> getGenre() const override { return get(EField::genre); }
    void setComment(const peru::CStringArg& comment) override { set(EField::comment, comment); }
    P<peru::IString> getComment() const override { return get(EField::comment); }

    void replaceCoverArt(int32_t index, const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                         EPictureType type) override;

    // Called by pictures, which write through to the tag: there is something to store.
    void markChanged() const { m_picturesChanged = true; }
    // Changes with every open() and close(), which end the validity of pictures.
    uint32_t getGeneration() const { return m_generation; }

protected:
    explicit CTagLibTag(const P<peru::IURI>& file) : m_uri(file) {}

    // Reads the file through the stream, including its audio properties, and fetches the tags. Returns null
    // if the content has another format.
    virtual std::unique_ptr<TagLib::File> openFile(TagLib::IOStream& stream) = 0;
    virtual void dropTags() = 0; // called before the file object is deleted
    // Only called while the tag is open. Writing the empty text removes the field.
    virtual TagLib::String readField(EField field) const = 0;
    virtual void writeField(EField field, const TagLib::String& text) = 0;
    virtual bool save(TagLib::File& file, TagLib::IOStream&) { return file.save(); }

private:
    void openWith(posix::EAccess access);
    void set(EField field, const peru::CStringArg& text);
    P<peru::IString> get(EField field) const;
    void write(bool certain); // the changes that were made to the tag

    P<peru::IURI> m_uri;
    std::unique_ptr<CTagLibIOStream> m_stream; // null after store; otherwise outlives m_file
    std::unique_ptr<TagLib::File> m_file;
    uint32_t m_generation = 0;
    std::map<EField, TagLib::String> m_texts; // that were set
    mutable bool m_picturesChanged = false;
};

} // namespace filetag::taglib
