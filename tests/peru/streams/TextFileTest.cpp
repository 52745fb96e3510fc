#include "peru/streams/TextFile.h"
#include "peru/Errors.h"
#include "peru/streams/StringStreams.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <clocale>

namespace {

using namespace peru;
using namespace std::string_literals;
using tests::errorOf;
using tests::toURI;

std::vector<std::string> readLines(const P<CTextFileReader>& reader) {
    std::vector<std::string> lines;
    while (reader->hasMoreLines()) lines.push_back(tests::text(reader->readLine()));
    return lines;
}

TEST(TextFileReader, KnowsTheMarks) {
    struct SCase {
        std::string bytes;
        ETextMark mark;
        std::vector<std::string> lines;
    };
    const tests::CTempFolder folder;
    const std::string locale = std::setlocale(LC_CTYPE, nullptr);
    ASSERT_TRUE(std::setlocale(LC_CTYPE, "C.UTF-8"));
    for (const SCase& c : {
             SCase{"", ETextMark::none, {}},
             {"a\nb", ETextMark::none, {"a", "b"}},
             {"\xC3\xA4", ETextMark::none, {"\xC3\xA4"}}, // in the code page
             {"\xEF\xBB\xBF", ETextMark::utf8, {}},
             {"\xEF\xBB\xBF\xC3\xA4\nb", ETextMark::utf8, {"\xC3\xA4", "b"}},
             {"\xFF\xFE\xE4\0\n\0b\0"s, ETextMark::utf16, {"\xC3\xA4", "b"}},
             {"\xFF\xFEx\0c"s, ETextMark::utf16, {"x"}}, // incomplete last character
             {"\xFF\xFE\0\0\xE4\0\0\0"s, ETextMark::utf32, {"\xC3\xA4"}},
         }) {
        const P<CTextFileReader> reader = make<CTextFileReader>(toURI(folder.write("text", c.bytes)));
        EXPECT_EQ(reader->getMark(), c.mark) << c.bytes;
        EXPECT_EQ(readLines(reader), c.lines) << c.bytes;
    }
    std::setlocale(LC_CTYPE, locale.c_str());
    EXPECT_EQ(make<CTextFileReader>(toURI(folder.write("text", "\xEF\xBB")))->getMark(), ETextMark::none);
}

TEST(TextFileReader, RefusesBigEndianText) {
    for (const std::string& bytes : {"\xFE\xFF\0a"s, "\0\0\xFE\xFF\0\0\0a"s})
        EXPECT_EQ(errorOf([&] { make<CTextFileReader>(make<CStringInStream>(CString::fromUTF8(bytes))); }),
                  "Big Endian not supported!");
}

TEST(TextFileReader, SaysWhenThereAreNoMoreLines) {
    const P<CTextFileReader> reader = make<CTextFileReader>(make<CStringInStream>(newString("one")));
    reader->readLine();
    EXPECT_EQ(errorOf([&] { reader->readLine(); }), "Error readline. No more lines to read");
    const tests::CTempFolder folder;
    EXPECT_THROW(make<CTextFileReader>(toURI(folder / "none")), CFileNotFoundError);
}

TEST(TextFileWriter, WritesMarkAndEncoding) {
    struct SCase {
        ETextMark mark;
        std::string bytes;
    };
    const tests::CTempFolder folder;
    const auto file = folder / "text";
    for (const SCase& c : {SCase{ETextMark::none, "\xC3\xA4"
                                                  "b"},
                           SCase{ETextMark::utf8, "\xEF\xBB\xBF\xC3\xA4"
                                                  "b"},
                           SCase{ETextMark::utf16, "\xFF\xFE\xE4\0b\0"s}}) {
        const P<CTextFileWriter> writer = make<CTextFileWriter>(toURI(file), c.mark, true);
        writer->write("\xE4");
        writer->write(u"b");
        EXPECT_EQ(tests::readFile(file), c.bytes); // flushed by each write
        writer->close();
        EXPECT_THROW(writer->write("c"), CStreamClosedError);
    }
    const P<CTextFileWriter> more =
        make<CTextFileWriter>(toURI(file), ETextMark::utf16, false, EOpenMode::append);
    more->write("c");
    more->close();
    EXPECT_EQ(tests::readFile(file), "\xFF\xFE\xE4\0b\0c\0"s);
    const auto other = make<CTextFileWriter>(make<CStringOutStream>(), ETextMark::utf32, false);
    EXPECT_EQ(errorOf([&] { other->write("x"); }), "CTextFileWriter::write: BOM Type not supported (5)");
}

} // namespace
