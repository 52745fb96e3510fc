#include "peru/Errors.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/HexData.h"
#include "peru/uri/URI.h"

#include "support/Files.h"

#include <algorithm>
#include <functional>
#include <limits>

namespace {

using namespace peru;
using tests::errorOf;
using tests::text;

// The bytes that `write` produces, in hexadecimal.
std::string written(const std::function<void(IDataOutStream&)>& write) {
    const P<CMemoryIOStream> memory = make<CMemoryIOStream>();
    const P<CDataOutStream> stream = make<CDataOutStream>(memory);
    write(*stream);
    return text(formatHexData(memory->getBlock()->getData(), memory->getSize()));
}

// Delivers its bytes one by one, as a pipe may.
class CTrickle : public CMemoryIOStream {
public:
    int64_t readSome(void* buffer, int64_t size) override {
        return CMemoryIOStream::readSome(buffer, std::min<int64_t>(size, 1));
    }
};

P<CDataInStream> reader(const std::string& hex) {
    const std::vector<uint8_t> bytes = parseHexData(CString::fromUTF8(hex));
    const P<CMemoryIOStream> memory = make<CTrickle>();
    memory->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    memory->reset();
    return make<CDataInStream>(memory);
}

class CPoint : public CObject, public ISerializable {
public:
    explicit CPoint(int16_t x = 0, bool forgetful = false) : m_x(x), m_forgetful(forgetful) {}
    void writeTo(const P<IDataOutStream>& stream) const override { stream->writeInt16(m_x); }
    void readFrom(const P<IDataInStream>& stream) override {
        m_x = stream->readInt16();
        if (m_forgetful) stream->readInt8();
    }
    int16_t m_x;
    bool m_forgetful;
};

TEST(DataStream, WritesTheWireForm) {
    EXPECT_EQ(written([](auto& s) { s.writeInt8(-2); }), "FE");
    EXPECT_EQ(written([](auto& s) { s.writeUInt16(0x1234); }), "3412");
    EXPECT_EQ(written([](auto& s) { s.writeInt32(-2); }), "FEFFFFFF");
    EXPECT_EQ(written([](auto& s) { s.writeUInt64(0x0102030405060708); }), "0807060504030201");
    EXPECT_EQ(written([](auto& s) { s.writeFloat(1.0f); }), "0000803F");
    EXPECT_EQ(written([](auto& s) { s.writeDouble(-2.0); }), "00000000000000C0");
    EXPECT_EQ(written([](auto& s) { s.writeBool(true); }), "01");
    EXPECT_EQ(written([](auto& s) { s.writeString(CString::empty()); }), "00000000");
    EXPECT_EQ(written([](auto& s) { s.writeString(nullptr); }), "00000000");
    EXPECT_EQ(written([](auto& s) { s.writeString(newString("a\xE4")); }), "0300000061C3A4");
    EXPECT_EQ(written([](auto& s) { s.writeString(newString(u"\u20AC")); }), "03000000E282AC");
    EXPECT_EQ(written([](auto& s) { s.writeURI(nullptr); }), "01");
    EXPECT_EQ(written([](auto& s) { s.writeURI(make<CURI>("a:b")); }), "0003000000613A62");
    EXPECT_EQ(written([](auto& s) { s.writeObject(nullptr); }), "01");
    EXPECT_EQ(written([](auto& s) { s.writeObject(make<CPoint>(int16_t{5})); }), "00050040E20100");
}

TEST(DataStream, ReadsWhatItWrote) {
    const P<CMemoryIOStream> memory = make<CMemoryIOStream>();
    const P<CSeekableDataOutStream> out = make<CSeekableDataOutStream>(memory);
    out->writeInt64(std::numeric_limits<int64_t>::min());
    out->writeDouble(0.1);
    out->writeFloat(-0.5f);
    out->writeUInt8(255);
    out->writeString(CString::fromUTF8("\xF0\x9F\x8E\xB5 \xFF")); // the bytes are kept, valid or not
    out->writeObject(make<CPoint>(int16_t{-7}));
    out->writeURI(make<CURI>("file:///x"));
    const P<CMemoryBlock> block = make<CMemoryBlock>(200000); // larger than one read step
    for (int i = 0; i < 200000; ++i) block->getData()[i] = static_cast<uint8_t>(i * 7);
    out->writeObject(block);
    EXPECT_EQ(out->getPosition(), memory->getSize());

    const P<CSeekableDataInStream> in = make<CSeekableDataInStream>(memory);
    in->reset();
    EXPECT_EQ(in->readInt64(), std::numeric_limits<int64_t>::min());
    EXPECT_EQ(in->readDouble(), 0.1);
    EXPECT_EQ(in->readFloat(), -0.5f);
    EXPECT_EQ(in->readUInt8(), 255);
    EXPECT_EQ(text(in->readString()), "\xF0\x9F\x8E\xB5 \xFF");
    const P<CPoint> point = make<CPoint>();
    EXPECT_EQ(in->readObject(point), point);
    EXPECT_EQ(point->m_x, -7);
    EXPECT_EQ(text(in->readURI()->getAsString()), "file:///x");
    const P<CMemoryBlock> copy = make<CMemoryBlock>();
    in->readObject(copy);
    EXPECT_TRUE(std::equal(copy->getData(), copy->getData() + copy->getSize(), block->getData(),
                           block->getData() + 200000));
    EXPECT_TRUE(in->isAtEnd());
}

TEST(DataStream, IsLenientAboutTheSizeOfAStringOnly) {
    for (const char* hex : {"", "030000"}) EXPECT_TRUE(reader(hex)->readString()->isEmpty()) << hex;
    const std::string large(70'000, 'x');
    const std::string form = written([&](auto& s) { s.writeString(newString(large.c_str())); });
    EXPECT_EQ(text(reader(form)->readString()), large);
    for (const char* hex : {"030000006162", "FFFFFF7F61", "FFFFFFFF61"})
        EXPECT_THROW(reader(hex)->readString(), CEndOfStreamError) << hex;
    EXPECT_THROW(reader("0300")->readInt32(), CEndOfStreamError);
    const P<CMemoryBlock> block = make<CMemoryBlock>();
    EXPECT_THROW(block->readFrom(reader("FFFFFF7F61")), CEndOfStreamError);
    EXPECT_LT(block->getCapacity(), 1 << 20) << "a hostile size takes no memory";
}

TEST(DataStream, NoticesReadersThatDisagree) {
    EXPECT_TRUE(reader("80")->readBool());
    EXPECT_EQ(errorOf([] { reader("00050040E20100FF")->readObject(make<CPoint>(int16_t{0}, true)); }),
              "Error in object serialization.. write/read differ?");
    EXPECT_FALSE(reader("01")->readObject(make<CPoint>()));
    EXPECT_FALSE(reader("01")->readURI());
}

TEST(HexData, RefusesWhatIsNoHexadecimalText) {
    EXPECT_EQ(parseHexData("00fFA5"), (std::vector<uint8_t>{0, 0xFF, 0xA5}));
    for (const char* bad : {"0", "0g", " 00", "0x00"})
        EXPECT_EQ(errorOf<CParseError>([&] { parseHexData(bad); }), "Error parsing hex data.");
}

} // namespace
