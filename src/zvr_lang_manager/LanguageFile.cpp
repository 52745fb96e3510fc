#include "zvr_lang_manager/LanguageFile.h"

#include "chf/PeruFileStream.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "zvr_lang_manager/LanguageData.h"

#include <string_view>

namespace zvr_lang {

using chf::makeChunkId;
using peru::CString;
using peru::IString;
using peru::P;

namespace {

constexpr std::string_view kSignature = "URESFILE";
constexpr const char* kAuthorKey = "ZVR_LANG_AUTHOR";

constexpr uint32_t kLanguageChunk = makeChunkId("lang");
constexpr uint32_t kVersionChunk = makeChunkId("vers");
constexpr uint32_t kApplicationChunk = makeChunkId("apid");
constexpr uint32_t kCommentChunk = makeChunkId("cmnt");
constexpr uint32_t kPropertiesChunk = makeChunkId("xdid");
constexpr uint32_t kBlockChunk = makeChunkId("STMP");
constexpr uint32_t kDataChunk = makeChunkId("data");
constexpr uint32_t kPackChunk = makeChunkId("RSID");

constexpr size_t kMinimumString = 4; // the count alone
constexpr size_t kMinimumEntry = 4 + 4 * kMinimumString;

struct SOpened {
    chf::TRef<chf::CChunkFile> chunks;
    int64_t size; // of the file in bytes
};

SOpened openChunks(const P<peru::IURI>& uri) {
    const auto stream = chf::CPeruFileStream::Open(uri, chf::EFileAccess::read);
    SOpened opened{chf::OpenChunkFile(stream.get()), stream->GetSize()};
    if (opened.chunks->GetSignature() != kSignature)
        throw peru::CFileError(
            peru::localize("zvr_lang.CLanguageFile.signature", "'%FILE%' is not a language file."), uri);
    const int64_t content = opened.chunks->GetSize();
    if (content < 0 || content > opened.size - opened.chunks->GetBase()) throwDamaged();
    return opened;
}

bool isSameLanguage(const SLanguageId& a, const SLanguageId& b) {
    return a.languageName == b.languageName && a.countryCode == b.countryCode;
}

SLanguageId findId(const P<IString>& text) {
    return findLanguageId(text, ELanguageIdKind::languageAndCountry);
}

} // namespace

CLanguageFile::CLanguageFile(const P<peru::IURI>& uri)
    : m_uri(uri), m_englishName(CString::empty()), m_nativeName(CString::empty()),
      m_applicationId(CString::empty()), m_applicationName(CString::empty()), m_comment(CString::empty()),
      m_author(CString::empty()) {}

CLanguageFile::~CLanguageFile() = default;

P<CLanguageFile> CLanguageFile::open(const P<peru::IURI>& uri) {
    P<CLanguageFile> file(new CLanguageFile(uri));
    const SOpened opened = openChunks(uri);
    file->readHeader(*opened.chunks, opened.size);
    return file;
}

void CLanguageFile::readHeader(chf::CChunkFile& file, int64_t size) {
    for (file.Rewind(); file.Next();) {
        const uint32_t id = file.GetId();
        if (id == kBlockChunk) continue;
        CLanguageData data(*file.OpenStream(), size);
        switch (id) {
        case kLanguageChunk:
            m_languageId = findId(data.readString());
            m_englishName = data.readString();
            m_nativeName = data.readString();
            break;
        case kVersionChunk:
            m_version = data.readInt();
            break;
        case kApplicationChunk:
            m_applicationId = data.readString();
            m_applicationName = data.readString();
            break;
        case kCommentChunk:
            m_comment = data.readString();
            break;
        case kPropertiesChunk:
            for (uint32_t count = data.readCount(2 * kMinimumString); count > 0; --count) {
                const P<IString> key = data.readString();
                const P<IString> value = data.readString();
                if (key->equals(kAuthorKey)) m_author = value;
            }
            break;
        }
    }
    if (!m_languageId.valid) throwDamaged();
}

void CLanguageFile::load(CLanguageEntries& entries, const peru::CStringArg& packName) const {
    const SOpened opened = openChunks(m_uri);
    for (opened.chunks->Rewind(); opened.chunks->Next();)
        if (opened.chunks->GetId() == kBlockChunk)
            readBlock(*opened.chunks->OpenIterator(), opened.size, entries, packName);
}

void CLanguageFile::readBlock(chf::CChunkIterator& block, int64_t size, CLanguageEntries& entries,
                              const peru::CStringArg& packName) const {
    if (block.GetSize() > size - block.GetBase()) throwDamaged();
    for (block.Rewind(); block.Next();) {
        const bool isLanguage = block.GetId() == kLanguageChunk;
        if (!isLanguage && block.GetId() != kPackChunk) continue;
        const P<IString> wanted = CLanguageData(*block.OpenStream(), size).readString();
        if (isLanguage ? !isSameLanguage(findId(wanted), m_languageId) : !wanted->equalsIgnoreCase(packName))
            return;
    }
    for (block.Rewind(); block.Next();) {
        if (block.GetId() != kDataChunk) continue;
        CLanguageData data(*block.OpenStream(), size);
        for (uint32_t count = data.readCount(kMinimumEntry); count > 0; --count) {
            SLanguageEntry entry;
            entry.flags = data.readInt();
            entry.key = data.readString();
            entry.text = data.readString();
            entry.defaultText = data.readString();
            entry.comment = data.readString();
            entries.add(std::move(entry));
        }
    }
}

} // namespace zvr_lang
