#include "peru/streams/TextFile.h"

#include "peru/Errors.h"
#include "peru/streams/StreamTools.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/strings/StringTokenizer.h"

#include <limits>
#include <string_view>

namespace peru {

namespace {

using namespace std::string_view_literals;

struct SMark {
    ETextMark mark;
    std::string_view bytes;
};

// Where one mark is a prefix of another, the longer one comes first.
constexpr SMark kMarks[] = {
    {ETextMark::utf8, "\xEF\xBB\xBF"sv},      {ETextMark::utf32BigEndian, "\x00\x00\xFE\xFF"sv},
    {ETextMark::utf32, "\xFF\xFE\x00\x00"sv}, {ETextMark::utf16BigEndian, "\xFE\xFF"sv},
    {ETextMark::utf16, "\xFF\xFE"sv},
};
constexpr SMark kNoMark{ETextMark::none, ""sv};

const SMark& findMark(std::string_view start) {
    for (const SMark& mark : kMarks)
        if (start.starts_with(mark.bytes)) return mark;
    return kNoMark;
}

const P<ICharEncoding>& getEncoding(ETextMark mark) {
    switch (mark) {
    case ETextMark::utf8:
        return getUTF8CharEncoding();
    case ETextMark::utf16:
        return getUTF16CharEncoding();
    case ETextMark::utf32:
        return getUTF32CharEncoding();
    default:
        throw CException(newString("Big Endian not supported!"), nullptr);
    }
}

} // namespace

CTextFileReader::CTextFileReader(const P<IURI>& uri)
    : CTextFileReader(getStreamManager()->getSeekableInStream(uri)) {}

CTextFileReader::CTextFileReader(const P<ISeekableInStream>& stream) {
    char start[4];
    int64_t known = 0;
    while (known < 4) {
        const int64_t count = stream->readSome(start + known, 4 - known);
        if (count == 0) break;
        known += count;
    }
    const SMark& mark = findMark({start, static_cast<size_t>(known)});
    m_mark = mark.mark;
    const P<ICharEncoding> encoding = m_mark == ETextMark::none ? nullptr : getEncoding(m_mark);

    stream->seek(static_cast<int64_t>(mark.bytes.size()));
    const std::string bytes = readAll(*stream);
    if (bytes.size() >= static_cast<size_t>(std::numeric_limits<int32_t>::max()))
        throw CStreamError(localize("peru.CTextFileReader.tooLong", "The text file '%URI%' is too long."),
                           stream->getURI());
    int32_t size = static_cast<int32_t>(bytes.size());
    if (encoding) {
        // An incomplete last character is ignored.
        if (m_mark == ETextMark::utf16) size -= size % 2;
        if (m_mark == ETextMark::utf32) size -= size % 4;
        m_text = m_mark == ETextMark::utf8 ? CString::fromUTF8(bytes)
                                           : P<IString>(make<CString>(encoding, bytes.data(), size));
    } else {
        m_text = make<CCPString>(bytes.data(), size);
    }
    m_lines = make<CStringLineTokenizerEnum>(m_text);
}

CTextFileReader::~CTextFileReader() = default;

bool CTextFileReader::hasMoreLines() const {
    return m_lines->hasMore();
}

P<IString> CTextFileReader::readLine() {
    if (!m_lines->hasMore()) throw CException(newString("Error readline. No more lines to read"), nullptr);
    return P<IString>(m_lines->getNext());
}

CTextFileWriter::CTextFileWriter(const P<IURI>& uri, ETextMark mark, bool flushEachWrite, EOpenMode mode)
    : CTextFileWriter(getStreamManager()->getOutStream(uri, mode), mark, flushEachWrite) {}

CTextFileWriter::CTextFileWriter(const P<IOutStream>& stream, ETextMark mark, bool flushEachWrite)
    : m_stream(stream), m_mark(mark), m_flushEachWrite(flushEachWrite) {
    // A file that is appended to already has its mark.
    if (const P<IResetableStream> positioned = tryCast<IResetableStream>(stream))
        m_markWritten = positioned->getPosition() > 0;
}

CTextFileWriter::~CTextFileWriter() = default;

void CTextFileWriter::write(const CStringArg& text) {
    if (m_mark != ETextMark::none && m_mark != ETextMark::utf8 && m_mark != ETextMark::utf16)
        throw CException(
            format("CTextFileWriter::write: BOM Type not supported (%d)", static_cast<int>(m_mark)), nullptr);
    if (!m_markWritten) {
        for (const SMark& mark : kMarks)
            if (mark.mark == m_mark)
                m_stream->write(mark.bytes.data(), static_cast<int64_t>(mark.bytes.size()));
        m_markWritten = true;
    }
    if (m_mark == ETextMark::utf16) {
        const std::u16string units = CString::toStdU16String(text);
        m_stream->write(units.data(), static_cast<int64_t>(units.size() * sizeof(char16_t)));
    } else {
        const std::string bytes = CString::toStdString(text);
        m_stream->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    }
    if (m_flushEachWrite) m_stream->flush();
}

void CTextFileWriter::flush() {
    m_stream->flush();
}

void CTextFileWriter::close() {
    m_stream->close();
}

} // namespace peru
