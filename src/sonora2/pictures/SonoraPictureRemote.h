// Carries a picture of any layout through a pipe.
#pragma once

#include "sonora2/pictures/ISonoraPictureRemote.h"

namespace sonora2::common {

// Receivers take the picture out with getPicture(): the picture operations of the wrapper itself do nothing
// and return 0 or an empty handle.
class SONORA2_API CSonoraPictureRemote : public peru::CObject, public ISonoraPictureRemote {
public:
    explicit CSonoraPictureRemote(const P<peru::IMemoryManager>& memory, P<ISonoraPicture> picture = nullptr);
    ~CSonoraPictureRemote() override;

    P<ISonoraPicture> getPicture() const override { return m_picture; }

    // The type as an int32, then the picture. The wrapper is empty after a failed read; an unknown type
    // throws CRemoteException.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

    double getTimestamp() const override { return 0.0; }
    int getWidth() const override { return 0; }
    int getHeight() const override { return 0; }
    bool isFlipped() const override { return false; }
    P<peru::IMemoryBlock> getRGBBlock(int, int, int, int) override { return nullptr; }
    void copyRGBRect(uint8_t*, int, int, int, int, int) override {}
    P<ISonoraPicture> getRGBPicture() override { return nullptr; }
    int getPictureType() const override { return 0; }
    P<peru::IMemoryBlock> getImagePlane(int, int, int, int, int) override { return nullptr; }
    void fillPlaneBlack(int, int, int, int, int) override {}
    void drawInto(const P<ISonoraPicture>&, int, int, int, int, int, int) override {}
    P<peru::IString> getPixelShaderName() const override;
    P<ISonoraPicture> createThumbnail() override { return nullptr; }

private:
    P<ISonoraPicture> m_picture;
    P<peru::IMemoryManager> m_memory;
};

} // namespace sonora2::common
