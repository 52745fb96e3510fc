// The tag of a WAVE file.
#pragma once

#include "filetag/IFileTag.h"
#include "filetag/rifftag/InfoList.h"
#include "peru/Object.h"

#include <map>
#include <optional>
#include <string>

namespace filetag::rifftag {

// Reads the first LIST chunk of type INFO. store() writes it as the last chunk of the file and removes all
// others of that type. Entries of odd size get a pad byte only if the environment variable
// TONEWRIGHT_PAD_INFO is "1". Texts are written as UTF-8. Album and album artist are not supported. Setting
// an empty text writes an entry without characters.
//
// Texts in an ID3v2 chunk, which many programs prefer, follow those of the list as they are set.
//
// RF64, the variant for files over 4 GB, is not supported.
class FILETAG_API CRIFFTag : public peru::CObject, public IFileTag {
public:
    explicit CRIFFTag(const P<peru::IURI>& file);
    ~CRIFFTag() override;

    bool isOpened() const override { return m_opened; }
    void open() override;
    void close() override;
    P<peru::IURI> getURI() const override { return m_uri; }
    // Does not touch the file if nothing was set. If another program has changed the list since it was
    // opened, what was set is set in the new one. The tag stays open.
    void store() override;

    void setTitle(const peru::CStringArg& title) override;
    P<peru::IString> getTitle() const override;
    void setArtist(const peru::CStringArg& artist) override;
    P<peru::IString> getArtist() const override;
    void setAlbum(const peru::CStringArg&) override {}
    P<peru::IString> getAlbum() const override { return peru::CString::empty(); }
    void setAlbumArtist(const peru::CStringArg&) override {}
    P<peru::IString> getAlbumArtist() const override { return peru::CString::empty(); }
    void setTrackNumber(const peru::CStringArg& number) override;
    P<peru::IString> getTrackNumber() const override;
    void setYear(const peru::CStringArg& year) override;
    P<peru::IString> getYear() const override;
    void setGenre(const peru::CStringArg& genre) override;
    P<peru::IString> getGenre() const override;
    void setComment(const peru::CStringArg& comment) override;
    P<peru::IString> getComment() const override;
    P<peru::IString> getTagType() const override;

private:
    P<peru::IString> get(const FourCC& id) const;
    void set(const FourCC& id, const peru::CStringArg& value);
    void setInList(const FourCC& id, const std::string& bytes);
    void storeOnce();

    P<peru::IURI> m_uri;
    bool m_opened = false;
    bool m_modified = false;
    std::optional<CInfoList> m_list;       // empty if the file has none
    std::vector<uint8_t> m_stored;         // the list in the file, empty if it has none
    std::map<FourCC, std::string> m_texts; // that were set
};

} // namespace filetag::rifftag
