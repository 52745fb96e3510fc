#include "peru/Errors.h"
#include "peru/streams/Base64Streams.h"
#include "peru/streams/StringStreams.h"
#include "peru/streams/posix/DiskStreams.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <random>

namespace {

using namespace peru;
using namespace peru::posix;

std::string encode(const std::string& bytes, size_t cut) {
    const P<CStringOutStream> text = make<CStringOutStream>();
    const P<CBase64OutStream> filter = make<CBase64OutStream>(text);
    for (size_t at = 0; at < bytes.size(); at += cut)
        filter->write(bytes.data() + at, static_cast<int64_t>(std::min(cut, bytes.size() - at)));
    filter->close();
    return CString::toStdString(text->getString());
}

std::string decode(const std::string& text, size_t cut) {
    const P<CBase64InStream> filter = make<CBase64InStream>(make<CStringInStream>(CString::fromUTF8(text)));
    std::string bytes, part(cut, '\0');
    while (const int64_t count = filter->readSome(part.data(), static_cast<int64_t>(cut)))
        bytes.append(part, 0, static_cast<size_t>(count));
    EXPECT_TRUE(filter->isAtEnd());
    return bytes;
}

// Compares with the system's base64 program, apart from padding and line breaks.
TEST(Base64, AgreesWithThePeerInEveryCut) {
    const tests::CTempFolder folder;
    std::mt19937 random(5);
    for (size_t size : {0u, 1u, 2u, 3u, 4u, 5u, 6u, 100u, 3071u, 3072u, 3073u, 20000u}) {
        std::string bytes(size, '\0');
        for (char& c : bytes) c = static_cast<char>(random());
        const auto in = folder.write("in", bytes);
        const auto out = folder / "out";
        ASSERT_EQ(std::system(("base64 -w0 '" + in.string() + "' >'" + out.string() + "'").c_str()), 0);
        std::string expected = tests::readFile(out);
        while (expected.ends_with('=')) expected.pop_back();
        for (size_t cut : {1u, 2u, 3u, 7u, 4096u, 100000u}) {
            ASSERT_EQ(encode(bytes, cut), expected) << size << " in cuts of " << cut;
            ASSERT_EQ(decode(expected, cut), bytes) << size << " in cuts of " << cut;
        }
        EXPECT_EQ(expected.size(), (8 * size + 5) / 6);
    }
}

TEST(Base64, RefusesOtherTextAndWhatIsPastTheEnd) {
    for (const char* text : {"QQ==", "QQ\n", "Q", "QUJDR", "Q-Q_", "\xC3\xA4"})
        EXPECT_THROW(decode(text, 100), CParseError) << text;
    const auto filter = make<CBase64InStream>(make<CStringInStream>(newString("QUJD")));
    char byte = 0;
    filter->skip(1);
    filter->read(&byte, 1);
    EXPECT_EQ(byte, 'B');
    EXPECT_THROW(filter->skip(2), CEndOfStreamError);

    const tests::CTempFolder folder;
    const P<IURI> uri = tests::toURI(folder / "out");
    const P<CBase64OutStream> filtered = make<CBase64OutStream>(make<CDiskOutStream>(uri, EOpenMode::create));
    filtered->write("ABCD", 4);
    EXPECT_TRUE(filtered->isAtEnd() && filtered->getURI()->equals(uri));
    filtered->flush();
    EXPECT_EQ(tests::readFile(folder / "out"), "QUJD");

    const P<CStringOutStream> text = make<CStringOutStream>();
    const P<CBase64OutStream> finished = make<CBase64OutStream>(text);
    finished->write("A", 1);
    finished->finish();
    EXPECT_THROW(finished->write("B", 1), CStreamClosedError);
    text->write("!", 1); // the target is still open
    EXPECT_EQ(CString::toStdString(text->getString()), "QQ!");
}

} // namespace
