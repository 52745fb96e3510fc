// Line-based text files with byte-order marks.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/streams/IStreamManager.h"
#include "peru/uri/IURI.h"

namespace peru {

enum class ETextMark { none = 0, utf8 = 1, utf16BigEndian = 2, utf16 = 3, utf32BigEndian = 4, utf32 = 5 };

class PERU_API ITextFileReader : public virtual IBase {
public:
    virtual ETextMark getMark() const = 0;
    virtual P<IString> getText() const = 0; // the whole content without the mark
    virtual bool hasMoreLines() const = 0;
    virtual P<IString> readLine() = 0; // throws CException after the last line
};

class PERU_API ITextFileWriter : public virtual IBase {
public:
    virtual void write(const CStringArg& text) = 0;
    virtual void flush() = 0;
    virtual void close() = 0;
};

// Reads the whole file on construction. A file without a mark is text in the system's code page. Throws
// CException with "Big Endian not supported!" for the big-endian marks.
class PERU_API CTextFileReader : public CObject, public ITextFileReader {
public:
    explicit CTextFileReader(const P<IURI>& uri); // through the stream manager
    explicit CTextFileReader(const P<ISeekableInStream>& stream);
    ~CTextFileReader() override;

    ETextMark getMark() const override { return m_mark; }
    P<IString> getText() const override { return m_text; }
    bool hasMoreLines() const override;
    P<IString> readLine() override;

private:
    ETextMark m_mark = ETextMark::none;
    P<IString> m_text;
    P<IEnum> m_lines;
};

// Writes UTF-8 with or without a mark, or little-endian UTF-16 with a mark; write() throws CException for the
// other marks. The mark is written together with the first text, so a file without text stays empty.
class PERU_API CTextFileWriter : public CObject, public ITextFileWriter {
public:
    CTextFileWriter(const P<IURI>& uri, ETextMark mark, bool flushEachWrite,
                    EOpenMode mode = EOpenMode::create); // through the stream manager
    CTextFileWriter(const P<IOutStream>& stream, ETextMark mark, bool flushEachWrite);
    ~CTextFileWriter() override;

    void write(const CStringArg& text) override;
    void flush() override;
    void close() override; // throws if buffered text cannot be written

private:
    P<IOutStream> m_stream;
    ETextMark m_mark;
    bool m_flushEachWrite;
    bool m_markWritten = false;
};

} // namespace peru
