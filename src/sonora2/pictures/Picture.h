// What the four memory layouts of a picture have in common.
#pragma once

#include "sonora2/media/ISonoraPicture.h"

namespace sonora2::common {

// The pixels lie in one block, plane after plane, without gaps. Coordinates are pixels of the picture, also
// for planes of chroma; rows are counted as they are stored, so from the bottom up in a flipped picture. Only
// copyRGBRect() uses the order of display.
//
// The size of the block is checked where pixels are used, not before: a picture from another process may
// state any size. CSonoraError reports a block that is too small, CInvalidArgError a rectangle outside of the
// picture. Not safe for concurrent use.
class SONORA2_API CPicture : public peru::CObject, public ISonoraPicture {
public:
    double getTimestamp() const override { return m_timestamp; }
    int getWidth() const override { return m_width; }
    int getHeight() const override { return m_height; }
    bool isFlipped() const override { return m_flipped; }
    P<peru::IMemoryBlock> getRGBBlock(int x, int y, int width, int height) override;
    void copyRGBRect(uint8_t* destination, int pitch, int x, int y, int width, int height) override;
    P<ISonoraPicture> getRGBPicture() override;
    P<peru::IMemoryBlock> getImagePlane(int plane, int x, int y, int width, int height) override;
    void fillPlaneBlack(int plane, int x, int y, int width, int height) override;
    // The destination must have the same layout.
    void drawInto(const P<ISonoraPicture>& destination, int destinationX, int destinationY, int x, int y,
                  int width, int height) override;
    P<ISonoraPicture> createThumbnail() override; // takes every fourth pixel of every fourth row

    // Timestamp, width, height, whether flipped, then the block.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

protected:
    // A run of units of equal size, each of which covers 1 << shift pixels in both directions.
    struct SPlane {
        int64_t offset = 0; // in the block
        int unitBytes = 1;
        int shift = 0;
        uint8_t black[2] = {}; // alternating bytes
    };

    // The block may be empty in a picture that is going to be read from a stream.
    CPicture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height, bool flipped,
             P<peru::IMemoryBlock> block);
    ~CPicture() override;

    virtual const char* getClassName() const = 0;
    virtual int getPlaneCount() const = 0;
    virtual SPlane getPlane(int plane) const = 0;
    virtual int64_t getLayoutBytes(int width, int height) const = 0;
    virtual bool isRGB() const { return false; }
    // The same layout in another size, with the same timestamp and direction.
    virtual P<CPicture> createSame(int width, int height, P<peru::IMemoryBlock> block) const = 0;
    // Pixels in the order in which the rows are stored.
    virtual void convertToRGB(uint32_t* pixels) const = 0;

    uint8_t* getPixels() const; // the block's bytes, of which there are enough for the layout
    int64_t getPitch(const SPlane& plane) const;
    P<CPicture> createEmptySame(int width, int height) const;
    const P<peru::IMemoryManager>& getMemory() const { return m_memory; }

private:
    struct SRectangle {
        uint8_t* first;
        int64_t pitch;
        int64_t rowBytes;
        int rows;
    };
    SRectangle locate(const SPlane& plane, int x, int y, int width, int height) const;
    bool isWhole(int x, int y, int width, int height) const;
    void requireInside(int x, int y, int width, int height) const;

    double m_timestamp;
    P<peru::IMemoryManager> m_memory;
    int m_width;
    int m_height;
    bool m_flipped;
    P<peru::IMemoryBlock> m_block;
    P<CPicture> m_rgb; // empty until it is needed
};

} // namespace sonora2::common
