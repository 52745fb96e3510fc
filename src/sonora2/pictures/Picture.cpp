#include "sonora2/pictures/Picture.h"

#include "peru/ISerializable.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/pictures/PlaneView.h"
#include "sonora2/pictures/RGBPicture.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace sonora2::common {

namespace {

constexpr int kThumbnailStep = 4;

} // namespace

CPicture::CPicture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height,
                   bool flipped, P<peru::IMemoryBlock> block)
    : m_timestamp(timestamp), m_memory(memory), m_width(width), m_height(height), m_flipped(flipped),
      m_block(std::move(block)) {}

CPicture::~CPicture() = default;

uint8_t* CPicture::getPixels() const {
    const int64_t size = m_block ? m_block->getSize() : 0;
    const int64_t pixels = int64_t{m_width} * m_height;
    // Every layout has at least a byte for each pixel, so the second comparison cannot overflow.
    if (m_width < 0 || m_height < 0 || pixels > size || getLayoutBytes(m_width, m_height) > size)
        throw CSonoraError(peru::format("%s: %d bytes are not enough for %d x %d pixels", getClassName(),
                                        size, m_width, m_height));
    return m_block ? m_block->getData() : nullptr;
}

int64_t CPicture::getPitch(const SPlane& plane) const {
    return int64_t{m_width >> plane.shift} * plane.unitBytes;
}

bool CPicture::isWhole(int x, int y, int width, int height) const {
    return x == 0 && y == 0 && width == m_width && height == m_height;
}

void CPicture::requireInside(int x, int y, int width, int height) const {
    const bool inside = x >= 0 && y >= 0 && width >= 0 && height >= 0 && int64_t{x} + width <= m_width &&
                        int64_t{y} + height <= m_height;
    if (!inside) throw peru::CInvalidArgError("x, y, width, height", getClassName());
}

CPicture::SRectangle CPicture::locate(const SPlane& plane, int x, int y, int width, int height) const {
    requireInside(x, y, width, height);
    const int64_t pitch = getPitch(plane);
    return {getPixels() + plane.offset + (y >> plane.shift) * pitch +
                int64_t{x >> plane.shift} * plane.unitBytes,
            pitch, int64_t{width >> plane.shift} * plane.unitBytes, width > 0 ? height >> plane.shift : 0};
}

P<peru::IMemoryBlock> CPicture::getImagePlane(int plane, int x, int y, int width, int height) {
    if (plane < 0 || plane >= getPlaneCount()) return nullptr;
    if (!isRGB() && width % 2 != 0)
        throw CSonoraError(peru::format("%s::getImagePlane nWidth must be a pow of 2!", getClassName()));
    const SPlane layout = getPlane(plane);
    const SRectangle from = locate(layout, x, y, width, height);
    if (isWhole(x, y, width, height)) {
        if (plane == 0) return m_block;
        return peru::make<CPlaneView>(m_block, layout.offset, from.rowBytes * from.rows);
    }
    P<peru::IMemoryBlock> part = m_memory->getBlock(from.rowBytes * from.rows);
    for (int row = 0; row < from.rows; ++row)
        std::memcpy(part->getData() + row * from.rowBytes, from.first + row * from.pitch,
                    static_cast<size_t>(from.rowBytes));
    return part;
}

void CPicture::fillPlaneBlack(int plane, int x, int y, int width, int height) {
    if (isRGB() || plane < 0 || plane >= getPlaneCount()) return;
    const SPlane layout = getPlane(plane);
    const SRectangle to = locate(layout, x, y, width, height);
    m_rgb.reset();
    for (int row = 0; row < to.rows; ++row)
        for (int64_t i = 0; i < to.rowBytes; ++i) to.first[row * to.pitch + i] = layout.black[i % 2];
}

void CPicture::drawInto(const P<ISonoraPicture>& destination, int destinationX, int destinationY, int x,
                        int y, int width, int height) {
    if (isRGB()) return;
    const P<CPicture> target = peru::tryCast<CPicture>(destination);
    if (!target || target->getPictureType() != getPictureType())
        throw peru::CInvalidArgError("destination", getClassName());
    for (int plane = 0; plane < getPlaneCount(); ++plane) {
        const SRectangle from = locate(getPlane(plane), x, y, width, height);
        const SRectangle to =
            target->locate(target->getPlane(plane), destinationX, destinationY, width, height);
        // A picture may be drawn into itself: rows are copied in an order that reads each before it is
        // overwritten.
        const bool upwards = to.first > from.first;
        for (int i = 0; i < from.rows; ++i) {
            const int row = upwards ? from.rows - 1 - i : i;
            std::memmove(to.first + row * to.pitch, from.first + row * from.pitch,
                         static_cast<size_t>(from.rowBytes));
        }
    }
    target->m_rgb.reset();
}

P<ISonoraPicture> CPicture::getRGBPicture() {
    if (isRGB()) return P<ISonoraPicture>::share(this);
    if (!m_rgb) {
        static_cast<void>(getPixels()); // before memory is taken for a size that another process has stated
        P<peru::IMemoryBlock> block = m_memory->getBlock(int64_t{m_width} * m_height * 4);
        // A picture without pixels may state any number of rows.
        if (m_width > 0) convertToRGB(reinterpret_cast<uint32_t*>(block->getData()));
        m_rgb =
            peru::make<CRGBPicture>(m_memory, m_timestamp, m_width, m_height, m_flipped, std::move(block));
    }
    return m_rgb;
}

P<peru::IMemoryBlock> CPicture::getRGBBlock(int x, int y, int width, int height) {
    return getRGBPicture()->getImagePlane(0, x, y, width, height);
}

void CPicture::copyRGBRect(uint8_t* destination, int pitch, int x, int y, int width, int height) {
    if (!isRGB()) return getRGBPicture()->copyRGBRect(destination, pitch, x, y, width, height);
    requireInside(x, y, width, height);
    if (height == 0) return;
    const int first = m_flipped ? m_height - y - 1 : y;
    const SPlane layout = getPlane(0);
    const int64_t step = m_flipped ? -getPitch(layout) : getPitch(layout);
    const uint8_t* from = getPixels() + first * getPitch(layout) + int64_t{x} * layout.unitBytes;
    for (int row = 0; row < height && width > 0; ++row)
        std::memcpy(destination + int64_t{row} * pitch, from + row * step, static_cast<size_t>(width) * 4);
}

P<CPicture> CPicture::createEmptySame(int width, int height) const {
    return createSame(width, height, m_memory->getBlock(getLayoutBytes(width, height)));
}

P<ISonoraPicture> CPicture::createThumbnail() {
    const uint8_t* pixels = getPixels();
    const P<CPicture> thumbnail = createEmptySame(m_width / kThumbnailStep, m_height / kThumbnailStep);
    for (int i = 0; i < getPlaneCount(); ++i) {
        const SPlane own = getPlane(i), reduced = thumbnail->getPlane(i);
        const int64_t unit = own.unitBytes;
        const int columns = thumbnail->m_width >> reduced.shift;
        const int rows = columns > 0 ? thumbnail->m_height >> reduced.shift : 0;
        uint8_t* to = thumbnail->getPixels() + reduced.offset;
        for (int row = 0; row < rows; ++row) {
            const uint8_t* from = pixels + own.offset + int64_t{row} * kThumbnailStep * getPitch(own);
            for (int column = 0; column < columns; ++column, to += unit)
                std::memcpy(to, from + column * kThumbnailStep * unit, static_cast<size_t>(unit));
        }
    }
    return thumbnail;
}

void CPicture::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeDouble(m_timestamp);
    stream->writeInt32(m_width);
    stream->writeInt32(m_height);
    stream->writeBool(m_flipped);
    if (m_block)
        m_block->writeTo(stream);
    else
        stream->writeInt32(0);
}

void CPicture::readFrom(const P<peru::IDataInStream>& stream) {
    m_rgb.reset();
    m_timestamp = stream->readDouble();
    m_width = stream->readInt32();
    m_height = stream->readInt32();
    m_flipped = stream->readBool();
    if (!m_block) m_block = m_memory->getBlock(1); // grows as the bytes arrive
    m_block->readFrom(stream);
}

} // namespace sonora2::common
