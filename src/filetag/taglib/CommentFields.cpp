#include "filetag/taglib/CommentFields.h"

#include "filetag/Text.h"
#include "filetag/taglib/Texts.h"

#include <flacpicture.h>

#include <algorithm>
#include <string_view>

namespace filetag::taglib {

using TagLib::ByteVector;
using TagLib::String;

const char kPictureField[] = "METADATA_BLOCK_PICTURE";

namespace {

constexpr unsigned int kCommentPacket = 1;

// Reads lengths of 32 bits and as many bytes.
class CFieldReader {
public:
    explicit CFieldReader(const ByteVector& bytes) : m_bytes(bytes) {}
    bool readNumber(unsigned int& number) {
        if (m_bytes.size() - m_position < sizeof number) return false;
        number = m_bytes.toUInt(m_position, false);
        m_position += static_cast<unsigned int>(sizeof number);
        return true;
    }
    bool readText(ByteVector& text) {
        unsigned int size = 0;
        if (!readNumber(size) || size > m_bytes.size() - m_position) return false;
        text = m_bytes.mid(m_position, size);
        m_position += size;
        return true;
    }

private:
    const ByteVector& m_bytes;
    unsigned int m_position = 0;
};

bool isPicture(const ByteVector& value) {
    const ByteVector bytes = ByteVector::fromBase64(value);
    return !bytes.isEmpty() && TagLib::FLAC::Picture().parse(bytes);
}

} // namespace

ByteVector readOggComment(TagLib::Ogg::File& file) {
    const ByteVector packet = file.packet(kCommentPacket);
    for (const ByteVector& signature : {ByteVector("\x03vorbis"), ByteVector("OpusTags")})
        if (packet.startsWith(signature)) return packet.mid(signature.size());
    // In Ogg FLAC the header of a block stands before it.
    const bool flac = !packet.isEmpty() && (packet[0] & 0x7f) == 4 &&
                      file.packet(0).startsWith("\x7f"
                                                "FLAC");
    return flac ? packet.mid(4) : file.packet(0).startsWith("Speex   ") ? packet : ByteVector();
}

void addDroppedFields(TagLib::Ogg::XiphComment& comment, const ByteVector& bytes) {
    CFieldReader reader(bytes);
    ByteVector field;
    unsigned int count = 0;
    if (!reader.readText(field) || !reader.readNumber(count)) return;
    while (count-- > 0 && reader.readText(field)) {
        const int equals = field.find("=");
        if (equals < 1) continue;
        const String key = String(field.mid(0, static_cast<unsigned int>(equals)), String::UTF8).upper();
        const ByteVector value = field.mid(static_cast<unsigned int>(equals) + 1);
        if (key == kPictureField ? isPicture(value) : value.isEmpty()) continue;
        if (key != kPictureField && !String(value, String::UTF8).isEmpty()) continue;
        comment.addField(key, toTagText(readNarrowText({value.data(), value.size()})), false);
    }
}

} // namespace filetag::taglib
