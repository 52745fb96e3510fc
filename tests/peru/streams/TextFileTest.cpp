#include "peru/streams/TextFile.h"
#include "peru/Errors.h"
#include "peru/streams/StringStreams.h"
#include "support/Files.h"
#include "support/TempFolder.h"

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
    using SCase = std::tuple<std::string, ETextMark, std::vector<std::string>>;
    const tests::CTempFolder folder;
    for (const auto& [bytes, mark, lines] : {
             SCase{"", ETextMark::none, {}},
             {"a\nb", ETextMark::none, {"a", "b"}},
             {"\xEF\xBB", ETextMark::none, {""}},         // half a mark
             {"\xC3\xA4", ETextMark::none, {"\xC3\xA4"}}, // in the code page
             {"\xEF\xBB\xBF", ETextMark::utf8, {}},
             {"\xEF\xBB\xBF\xC3\xA4\nb", ETextMark::utf8, {"\xC3\xA4", "b"}},
             {"\xFF\xFE\xE4\0\n\0b\0"s, ETextMark::utf16, {"\xC3\xA4", "b"}},
             {"\xFF\xFEx\0c"s, ETextMark::utf16, {"x"}}, // incomplete last character
             {"\xFF\xFE\0\0\xE4\0\0\0"s, ETextMark::utf32, {"\xC3\xA4"}},
         }) {
        const P<CTextFileReader> reader = make<CTextFileReader>(toURI(folder.write("text", bytes)));
        EXPECT_EQ(reader->getMark(), mark) << bytes;
        EXPECT_EQ(readLines(reader), lines) << bytes;
    }
}

TEST(TextFileReader, RefusesBigEndianTextAndSaysWhenThereAreNoMoreLines) {
    for (const std::string& bytes : {"\xFE\xFF\0a"s, "\0\0\xFE\xFF\0\0\0a"s})
        EXPECT_EQ(errorOf([&] { make<CTextFileReader>(make<CStringInStream>(CString::fromUTF8(bytes))); }),
                  "Big Endian not supported!");
    const P<CTextFileReader> reader = make<CTextFileReader>(make<CStringInStream>(newString("one")));
    reader->readLine();
    EXPECT_EQ(errorOf([&] { reader->readLine(); }), "Error readline. No more lines to read");
    const tests::CTempFolder folder;
    EXPECT_THROW(make<CTextFileReader>(toURI(folder / "none")), CFileNotFoundError);
}

TEST(TextFileWriter, WritesMarkAndEncoding) {
    using SCase = std::pair<ETextMark, std::string>;
    const tests::CTempFolder folder;
    const auto file = folder / "text";
    for (const auto& [mark, bytes] :
         {SCase{ETextMark::none, "\xC3\xA4z"}, SCase{ETextMark::utf8, "\xEF\xBB\xBF\xC3\xA4z"},
          SCase{ETextMark::utf16, "\xFF\xFE\xE4\0z\0"s}}) {
        const P<CTextFileWriter> writer = make<CTextFileWriter>(toURI(file), mark, true);
        writer->write("\xE4");
        writer->write(u"z");
        EXPECT_EQ(tests::readFile(file), bytes); // flushed by each write
        writer->close();
        EXPECT_THROW(writer->write("c"), CStreamClosedError);
    }
    const P<CTextFileWriter> more =
        make<CTextFileWriter>(toURI(file), ETextMark::utf16, false, EOpenMode::append);
    more->write("c");
    EXPECT_EQ(tests::readFile(file), "\xFF\xFE\xE4\0z\0"s);
    more->flush();
    EXPECT_EQ(tests::readFile(file), "\xFF\xFE\xE4\0z\0c\0"s);
    const auto other = make<CTextFileWriter>(make<CStringOutStream>(), ETextMark::utf32, false);
    EXPECT_EQ(errorOf([&] { other->write("x"); }), "CTextFileWriter::write: BOM Type not supported (5)");
}

} // namespace
