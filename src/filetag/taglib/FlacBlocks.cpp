#include "filetag/taglib/FlacBlocks.h"

#include <flacpicture.h>
#include <id3v2header.h>
#include <xiphcomment.h>

#include <functional>

namespace filetag::taglib {
namespace {

using TagLib::ByteVector;

constexpr unsigned int kBlockHeader = 4;
constexpr unsigned int kLargestBlock = 0xffffff;
constexpr uint8_t kLastFlag = 0x80;
constexpr uint8_t kComment = 4;
constexpr uint8_t kPicture = 6;
constexpr uint8_t kHidden = 126;

struct SBlock {
    long start;
    uint8_t type;
    unsigned int size;
};

// Negative if the content is not FLAC.
long findBlocks(TagLib::IOStream& stream) {
    stream.seek(0);
    const ByteVector id3 = stream.readBlock(TagLib::ID3v2::Header::size());
    long start = 0;
    if (id3.startsWith("ID3")) start = static_cast<long>(TagLib::ID3v2::Header(id3).completeTagSize());
    stream.seek(start);
    return stream.readBlock(4) == "fLaC" ? start + 4 : -1;
}

void forEachBlock(TagLib::IOStream& stream, const std::function<void(const SBlock&)>& visit) {
    long start = findBlocks(stream);
    for (bool last = start < 0; !last;) {
        stream.seek(start);
        const ByteVector header = stream.readBlock(kBlockHeader);
        if (header.size() < kBlockHeader) break;
        const auto type = static_cast<uint8_t>(header[0]);
        const SBlock block{start, static_cast<uint8_t>(type & ~kLastFlag), header.toUInt(1, 3, true)};
        visit(block);
        last = (type & kLastFlag) != 0;
        start += static_cast<long>(kBlockHeader + block.size);
    }
    stream.seek(0);
}

ByteVector readBody(TagLib::IOStream& stream, const SBlock& block) {
    stream.seek(block.start + static_cast<long>(kBlockHeader));
    return stream.readBlock(block.size);
}

void setType(TagLib::IOStream& stream, const SBlock& block, uint8_t type) {
    stream.seek(block.start);
    const auto flag = static_cast<uint8_t>(stream.readBlock(1)[0]) & kLastFlag;
    stream.seek(block.start);
    stream.writeBlock(ByteVector(1, static_cast<char>(flag | type)));
}

} // namespace

void hideUnreadablePictures(TagLib::IOStream& stream) {
    forEachBlock(stream, [&stream](const SBlock& block) {
        if (block.type == kPicture && !TagLib::FLAC::Picture().parse(readBody(stream, block)))
            setType(stream, block, kHidden);
    });
}

void restorePictures(TagLib::IOStream& stream) {
    forEachBlock(stream, [&stream](const SBlock& block) {
        if (block.type == kHidden) setType(stream, block, kPicture);
    });
}

ByteVector readFlacComment(TagLib::IOStream& stream) {
    ByteVector comment;
    forEachBlock(stream, [&](const SBlock& block) {
        if (block.type == kComment && comment.isEmpty()) comment = readBody(stream, block);
    });
    return comment;
}

bool fitsFlacBlock(unsigned int size) {
    return size <= kLargestBlock;
}

bool fitsFlacBlocks(TagLib::FLAC::File& file) {
    const TagLib::Ogg::XiphComment* comment = file.xiphComment(false);
    if (comment && !fitsFlacBlock(comment->render(false).size())) return false;
    for (const TagLib::FLAC::Picture* picture : file.pictureList())
        if (!fitsFlacBlock(picture->render().size())) return false;
    return true;
}

bool saveFlac(TagLib::FLAC::File& file) {
    const TagLib::Ogg::XiphComment* comment = file.xiphComment(false);
    if (file.hasXiphComment() || !comment) return file.save();
    const TagLib::Ogg::FieldListMap fields = comment->fieldListMap();
    if (!file.save()) return false;
    for (const auto& [key, values] : fields) {
        file.xiphComment(true)->removeFields(key);
        for (const TagLib::String& value : values) file.xiphComment(true)->addField(key, value, false);
    }
    return file.save();
}

} // namespace filetag::taglib
