#include "filetag/taglib/AsfObjects.h"

#include <algorithm>
#include <optional>

namespace filetag::taglib {
namespace {

using TagLib::ByteVector;

constexpr unsigned int kGuid = 16;
constexpr unsigned int kObjectHeader = 24; // with a size of 64 bits
constexpr unsigned int kHeaderFields = 6;
constexpr unsigned int kExtensionFields = 22;
constexpr long kLargestMoved = 256L * 1024 * 1024;

const ByteVector kHeader("\x30\x26\xB2\x75\x8E\x66\xCF\x11\xA6\xD9\x00\xAA\x00\x62\xCE\x6C", kGuid);
const ByteVector kExtension("\xB5\x03\xBF\x5F\x2E\xA9\xCF\x11\x8E\xE3\x00\xC0\x0C\x20\x53\x65", kGuid);
const ByteVector kContent("\x40\xA4\xD0\xD2\x07\xE3\xD2\x11\x97\xF0\x00\xA0\xC9\x5E\xA8\x50", kGuid);
const ByteVector kMetadata("\xEA\xCB\xF8\xC5\xAF\x5B\x77\x48\x84\x67\xAA\x8C\x44\xFA\x4C\xCA", kGuid);
const ByteVector kLibrary("\x94\x1C\x23\x44\x98\x94\xD1\x49\xA1\x41\x1D\x13\x4E\x45\x70\x54", kGuid);

struct SObject {
    long start;
    long end;
};

// The object at the position, cut at `limit`; empty if there is none.
std::optional<SObject> readObject(TagLib::IOStream& stream, long position, long limit, ByteVector& guid) {
    stream.seek(position);
    const ByteVector header = stream.readBlock(kObjectHeader);
    if (header.size() < kObjectHeader) return {};
    const long long size = header.toLongLong(kGuid, false);
    if (size < kObjectHeader || size > limit - position) return {};
    guid = header.mid(0, kGuid);
    return SObject{position, position + static_cast<long>(size)};
}

std::optional<SObject> findObject(TagLib::IOStream& stream, long start, long end, const ByteVector& wanted) {
    ByteVector guid;
    for (std::optional<SObject> object; (object = readObject(stream, start, end, guid)); start = object->end)
        if (guid == wanted) return object;
    return {};
}

void moveBefore(TagLib::IOStream& stream, long start, long end, const ByteVector& moved,
                const ByteVector& anchor) {
    const std::optional<SObject> later = findObject(stream, start, end, moved);
    const std::optional<SObject> earlier = findObject(stream, start, end, anchor);
    if (!later || !earlier || later->start < earlier->start) return;
    const long size = later->end - later->start;
    if (size > kLargestMoved) return;
    stream.seek(later->start);
    const ByteVector bytes = stream.readBlock(static_cast<unsigned long>(size));
    stream.removeBlock(static_cast<unsigned long>(later->start), static_cast<unsigned long>(size));
    stream.insert(bytes, static_cast<unsigned long>(earlier->start), 0);
}

void orderObjects(TagLib::IOStream& stream) {
    ByteVector guid;
    const std::optional<SObject> header = readObject(stream, 0, stream.length(), guid);
    if (!header || guid != kHeader) return;
    const long start = kObjectHeader + kHeaderFields;
    moveBefore(stream, start, header->end, kContent, kExtension);
    if (const auto extension = findObject(stream, start, header->end, kExtension))
        moveBefore(stream, extension->start + kObjectHeader + kExtensionFields, extension->end, kMetadata,
                   kLibrary);
}

} // namespace

void orderAsfObjects(TagLib::IOStream& stream) {
    orderObjects(stream);
    stream.seek(0);
}

} // namespace filetag::taglib
