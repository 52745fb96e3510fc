#include "filetag/rifftag/RIFFTag.h"

#include "filetag/Text.h"
#include "filetag/id3tag/TextFrames.h"
#include "filetag/posix/OpenedFile.h"
#include "filetag/taglib/Texts.h"
#include "peru/Errors.h"
#include "peru/files/IFileReplacement.h"
#include "peru/streams/IStreamManager.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/ISystem.h"

#include <cstdlib>
#include <string_view>
#include <utility>

namespace filetag::rifftag {

namespace {

constexpr FourCC kTitle{'I', 'N', 'A', 'M'};
constexpr FourCC kArtist{'I', 'A', 'R', 'T'};
constexpr FourCC kTrackNumber{'T', 'R', 'C', 'K'};
constexpr FourCC kYear{'I', 'C', 'R', 'D'};
constexpr FourCC kGenre{'I', 'G', 'N', 'R'};
constexpr FourCC kComment{'I', 'C', 'M', 'T'};

taglib::EField getField(const FourCC& id) {
    return id == kTitle         ? taglib::EField::title
           : id == kArtist      ? taglib::EField::artist
           : id == kTrackNumber ? taglib::EField::trackNumber
           : id == kYear        ? taglib::EField::year
           : id == kGenre       ? taglib::EField::genre
                                : taglib::EField::comment;
}

// The list is held in memory. No program writes one anywhere near this size.
constexpr int64_t kMaxList = 64 * 1024 * 1024;
constexpr int64_t kChunkHeader = sizeof(SChunkHeader);
constexpr int64_t kMaxFile = int64_t{0xFFFFFFFF} + kChunkHeader;

// Set by programs for which the other readers matter more than older versions of this library.
bool isPaddingWanted() {
    const char* value = std::getenv("TONEWRIGHT_PAD_INFO");
    return value && std::string_view(value) == "1";
}

[[noreturn]] void throwListTooLarge(const P<peru::IURI>& file) {
    throw peru::CFileError(peru::localize("filetag.CRIFFTag.listTooLarge",
                                          "The texts in the tag of the file '%URI%' take more than 64 MB."),
                           file);
}

// Runs the operation and rethrows stream errors as file errors.
template <class Operation> void withFileErrors(const P<peru::IURI>& file, Operation&& operation) {
    try {
        operation();
    } catch (const peru::CStreamError& error) {
        throw peru::CFileError(error.getDescription(), file, error.getTitle());
    }
}

P<peru::ISeekableInStream> openFile(const P<peru::IURI>& file) {
    return peru::getStreamManager()->getSeekableInStream(file);
}

CChunkReader readChunks(const P<peru::ISeekableInStream>& stream, const P<peru::IURI>& file) {
    CChunkReader chunks(stream);
    if (!chunks.isWave()) throw peru::CFileFormatNotSupportedError(file);
    return chunks;
}

// In the new file every chunk has its real size and is padded with a zero if that is odd, so that other
// programs find the chunks behind it, especially the list at the end.
bool needsPad(const SChunk& chunk) {
    return chunk.size % 2 != 0;
}

// The first list of descriptive texts; empty if there is none.
std::vector<uint8_t> readList(const P<peru::ISeekableInStream>& file, const P<peru::IURI>& uri) {
    CChunkReader chunks = readChunks(file, uri);
    for (SChunk chunk; chunks.next(chunk);) {
        if (!chunk.info) continue;
        if (chunk.size > kMaxList) throwListTooLarge(uri);
        std::vector<uint8_t> bytes(static_cast<size_t>(kChunkHeader + chunk.size));
        file->seek(chunk.offset);
        file->read(bytes.data(), static_cast<int64_t>(bytes.size()));
        return bytes;
    }
    return {};
}

using Texts = std::map<FourCC, std::string>;

// A chunk that gets another body.
struct SNewChunk {
    int64_t offset = -1; // in the old file; -1 for none
    TagLib::ByteVector body;
};

// The ID3v2 chunk with these texts, if that differs from the one in the file.
SNewChunk changeId3Chunk(const P<peru::ISeekableInStream>& file, const P<peru::IURI>& uri,
                         const Texts& texts) {
    CChunkReader chunks = readChunks(file, uri);
    for (SChunk chunk; chunks.next(chunk);) {
        if (chunk.id != FourCC{'i', 'd', '3', ' '} && chunk.id != FourCC{'I', 'D', '3', ' '}) continue;
        if (chunk.size > kMaxList) break;
        TagLib::ByteVector old(static_cast<unsigned int>(chunk.size), '\0');
        file->seek(chunk.offset + kChunkHeader);
        file->read(old.data(), chunk.size);
        std::map<taglib::EField, TagLib::String> fields;
        for (const auto& [id, text] : texts) fields[getField(id)] = taglib::toTagText(readNarrowText(text));
        const TagLib::ByteVector body = id3tag::changeTexts(old, fields);
        if (body != old) return {chunk.offset, body};
        break;
    }
    return {};
}

int64_t getNewSize(const P<peru::ISeekableInStream>& file, const P<peru::IURI>& uri, int64_t listSize,
                   const SNewChunk& changed) {
    CChunkReader chunks = readChunks(file, uri);
    int64_t size = CChunkReader::kHeaderSize + listSize;
    for (SChunk chunk; chunks.next(chunk);) {
        if (chunk.info) continue;
        if (chunk.offset == changed.offset) chunk.size = changed.body.size();
        size += kChunkHeader + chunk.size + (needsPad(chunk) ? 1 : 0);
    }
    return size;
}

// Joins adjacent ranges into one copy, since a file may consist of very many small chunks.
class CCopier {
public:
    explicit CCopier(const P<peru::IFileReplacement>& target) : m_target(target) {}

    void copy(int64_t begin, int64_t end) {
        if (begin != m_end) {
            finish();
            m_begin = begin;
        }
        m_end = end;
    }
    void write(const void* bytes, int64_t size) {
        finish();
        m_target->getStream()->write(bytes, size);
    }
    void finish() {
        if (m_end > m_begin) m_target->copyFromOld(m_begin, m_end - m_begin);
        m_begin = m_end;
    }

private:
    P<peru::IFileReplacement> m_target;
    int64_t m_begin = 0;
    int64_t m_end = 0;
};

void copyFile(const P<peru::ISeekableInStream>& file, const P<peru::IURI>& uri,
              const std::vector<uint8_t>& list, const SNewChunk& changed, CCopier& copier) {
    CChunkReader chunks = readChunks(file, uri);
    for (SChunk chunk; chunks.next(chunk);) {
        if (chunk.info) continue;
        if (chunk.offset == changed.offset) {
            const SChunkHeader header{chunk.id, changed.body.size()};
            copier.write(&header, sizeof header);
            copier.write(changed.body.data(), changed.body.size());
            if (changed.body.size() % 2 != 0) copier.write("", 1);
            continue;
        }
        const int64_t body = chunk.offset + kChunkHeader;
        const bool mended = chunk.size != chunk.toldSize;
        if (mended) {
            const SChunkHeader header{chunk.id, static_cast<uint32_t>(chunk.size)};
            copier.write(&header, sizeof header);
        }
        copier.copy(mended ? body : chunk.offset, body + chunk.size);
        if (needsPad(chunk)) copier.write("", 1);
    }
    copier.write(list.data(), static_cast<int64_t>(list.size()));
    copier.copy(chunks.getEnd(), file->getSize());
    copier.finish();
}

} // namespace

CRIFFTag::CRIFFTag(const P<peru::IURI>& file) : m_uri(file) {}

CRIFFTag::~CRIFFTag() = default;

void CRIFFTag::open() {
    close();
    withFileErrors(m_uri, [this] {
        const posix::COpenedFile file(m_uri);
        m_stored = readList(openFile(m_uri), m_uri);
    });
    if (!m_stored.empty()) m_list.emplace(m_stored);
    m_opened = true;
}

void CRIFFTag::close() {
    m_opened = false;
    m_modified = false;
    m_list.reset();
    m_stored.clear();
    m_texts.clear();
}

void CRIFFTag::store() {
    if (!m_modified) return;
    for (int attempt = 1; m_modified; ++attempt) {
        try {
            storeOnce();
        } catch (const posix::CFileChangedError&) {
            if (attempt == posix::kAttempts) throw;
        }
    }
}

void CRIFFTag::storeOnce() {
    withFileErrors(m_uri, [this] {
        const posix::COpenedFile file(m_uri, posix::EAccess::exclusive);
        const posix::COpenedFile::CLock lock(file);
        const P<peru::ISeekableInStream> old = openFile(m_uri);
        if (std::vector<uint8_t> now = readList(old, m_uri); now != m_stored) {
            m_list = now.empty() ? CInfoList() : CInfoList(now);
            m_stored = std::move(now);
            for (const auto& [id, bytes] : m_texts) setInList(id, bytes);
        }
        const std::vector<uint8_t> list = m_list->render(isPaddingWanted());
        const SNewChunk id3 = changeId3Chunk(old, m_uri, m_texts);
        const int64_t size = getNewSize(old, m_uri, static_cast<int64_t>(list.size()), id3);
        if (size > kMaxFile)
            throw peru::CFileError(
                peru::localize("filetag.CRIFFTag.fileTooLarge",
                               "The file '%URI%' would take more than 4 GB with its tag, which a WAVE "
                               "file cannot hold."),
                m_uri);

        const P<peru::IFileReplacement> replacement = peru::getSystem()->startReplacement(m_uri);
        CCopier copier(replacement);
        const auto riffSize = static_cast<uint32_t>(size - kChunkHeader);
        copier.write("RIFF", 4);
        copier.write(&riffSize, sizeof riffSize);
        copier.write("WAVE", 4);
        copyFile(old, m_uri, list, id3, copier);
        file.checkUnchanged();
        replacement->commit();
        m_stored = list;
        m_texts.clear();
        m_modified = false;
    });
}

P<peru::IString> CRIFFTag::get(const FourCC& id) const {
    return m_list ? readNarrowText(m_list->get(id)) : peru::CString::empty();
}

void CRIFFTag::set(const FourCC& id, const peru::CStringArg& value) {
    if (!m_opened) return;
    std::string bytes = peru::CString::toStdString(value);
    setInList(id, bytes);
    m_texts[id] = std::move(bytes);
    m_modified = true;
}

void CRIFFTag::setInList(const FourCC& id, const std::string& bytes) {
    // Checked here, so that every list that was stored can be opened again.
    const int64_t used = m_list ? m_list->getSize() : 0;
    if (used + static_cast<int64_t>(bytes.size()) + 32 > kMaxList) throwListTooLarge(m_uri);
    if (!m_list) m_list.emplace();
    m_list->set(id, bytes);
}

void CRIFFTag::setTitle(const peru::CStringArg& title) {
    set(kTitle, title);
}
P<peru::IString> CRIFFTag::getTitle() const {
    return get(kTitle);
}
void CRIFFTag::setArtist(const peru::CStringArg& artist) {
    set(kArtist, artist);
}
P<peru::IString> CRIFFTag::getArtist() const {
    return get(kArtist);
}
void CRIFFTag::setTrackNumber(const peru::CStringArg& number) {
    set(kTrackNumber, number);
}
P<peru::IString> CRIFFTag::getTrackNumber() const {
    return get(kTrackNumber);
}
void CRIFFTag::setYear(const peru::CStringArg& year) {
    set(kYear, year);
}
P<peru::IString> CRIFFTag::getYear() const {
    return get(kYear);
}
void CRIFFTag::setGenre(const peru::CStringArg& genre) {
    set(kGenre, genre);
}
P<peru::IString> CRIFFTag::getGenre() const {
    return get(kGenre);
}
void CRIFFTag::setComment(const peru::CStringArg& comment) {
    set(kComment, comment);
}
P<peru::IString> CRIFFTag::getComment() const {
    return get(kComment);
}
P<peru::IString> CRIFFTag::getTagType() const {
    return peru::newString(m_list ? "INFO" : "");
}

} // namespace filetag::rifftag
