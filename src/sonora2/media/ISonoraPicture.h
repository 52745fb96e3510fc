// One frame of video.
#pragma once

#include "peru/MemoryManager.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// In one of four memory layouts. Rectangles are x, y, width, height in pixels.
class SONORA2_API ISonoraPicture : public virtual peru::IBase, public virtual peru::ISerializable {
public:
    enum EType : int { kRGB = 1, kYUY2 = 2, kNV12 = 3, kYV12 = 4 };

    virtual double getTimestamp() const = 0; // seconds
    virtual int getWidth() const = 0;
    virtual int getHeight() const = 0;
    virtual bool isFlipped() const = 0; // rows are stored bottom up
    // The rectangle as 32-bit pixels: the whole picture shares its block, a part is copied.
    virtual P<peru::IMemoryBlock> getRGBBlock(int x, int y, int width, int height) = 0;
    // Copies the rectangle as 32-bit pixels in display order; `pitch` is the bytes from row to row.
    virtual void copyRGBRect(uint8_t* destination, int pitch, int x, int y, int width, int height) = 0;
    // Itself for RGB, otherwise the conversion, which is made once.
    virtual P<ISonoraPicture> getRGBPicture() = 0;
    virtual int getPictureType() const = 0;
    // Plane 0 is luma or RGB, 1 and 2 are chroma; empty for a plane that the layout does not have.
    virtual P<peru::IMemoryBlock> getImagePlane(int plane, int x, int y, int width, int height) = 0;
    // Both do nothing in RGB.
    virtual void fillPlaneBlack(int plane, int x, int y, int width, int height) = 0;
    virtual void drawInto(const P<ISonoraPicture>& destination, int destinationX, int destinationY, int x,
                          int y, int width, int height) = 0;
    virtual P<peru::IString> getPixelShaderName() const = 0; // of the conversion to RGB; empty for RGB
    virtual P<ISonoraPicture> createThumbnail() = 0;         // a quarter of the width and height
};

} // namespace sonora2::common
