// A language file: the translations of one part of the program into one language.
//
// A chunk file (chf/ChunkFile.h) with the signature "URESFILE". These chunks are at the top level, in any
// order; strings and integers are as in LanguageData.h.
//
//   lang  three strings: the identifier, such as "de-DE"; the language's name in English and in itself
//   vers  the version of the contents of the format, kVersion
//   apid  two strings: the application's identifier and name
//   cmnt  a comment
//   xdid  a count and as many pairs of strings, a key and a value
//   STMP  a block of texts; may be repeated. Holds chunks:
//         data  a count and as many entries: flags and four strings (SLanguageEntry)
//         lang  optional: the identifier of the only language that the block is for
//         RSID  optional: the base name of the only pack that the block is for
#pragma once

#include "chf/ChunkFile.h"
#include "peru/Object.h"
#include "peru/uri/IURI.h"
#include "zvr_lang_manager/LanguageEntries.h"
#include "zvr_lang_manager/LanguageId.h"

namespace zvr_lang {

class ZVR_LANG_API CLanguageFile : public peru::CObject {
public:
    static constexpr uint32_t kVersion = 1;

    // Reads everything but the texts and closes the file. Throws peru::CException if the file cannot be read,
    // has another signature, is incomplete, or does not name a valid language.
    static peru::P<CLanguageFile> open(const peru::P<peru::IURI>& uri);

    // Adds the entries of all blocks that are for this file's language and for the pack. Opens the file
    // again. Throws like open; some entries may have been added then.
    void load(CLanguageEntries& entries, const peru::CStringArg& packName) const;

    const peru::P<peru::IURI>& getURI() const { return m_uri; }
    const SLanguageId& getLanguageId() const { return m_languageId; }
    uint32_t getVersion() const { return m_version; }
    const peru::P<peru::IString>& getEnglishName() const { return m_englishName; }
    const peru::P<peru::IString>& getNativeName() const { return m_nativeName; }
    const peru::P<peru::IString>& getApplicationId() const { return m_applicationId; }
    const peru::P<peru::IString>& getApplicationName() const { return m_applicationName; }
    const peru::P<peru::IString>& getComment() const { return m_comment; }
    const peru::P<peru::IString>& getAuthor() const { return m_author; }

protected:
    explicit CLanguageFile(const peru::P<peru::IURI>& uri);
    ~CLanguageFile() override;

private:
    void readHeader(chf::CChunkFile& file, int64_t size);
    void readBlock(chf::CChunkIterator& block, int64_t size, CLanguageEntries& entries,
                   const peru::CStringArg& packName) const;

    peru::P<peru::IURI> m_uri;
    SLanguageId m_languageId;
    uint32_t m_version = 0;
    peru::P<peru::IString> m_englishName;
    peru::P<peru::IString> m_nativeName;
    peru::P<peru::IString> m_applicationId;
    peru::P<peru::IString> m_applicationName;
    peru::P<peru::IString> m_comment;
    peru::P<peru::IString> m_author;
};

} // namespace zvr_lang
