#include "sonora2/pictures/SonoraPictureRemote.h"

#include "peru/ISerializable.h"
#include "peru/remote/RemoteException.h"
#include "sonora2/pictures/NV12Picture.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/pictures/YUY2Picture.h"
#include "sonora2/pictures/YV12Picture.h"

#include <utility>

namespace sonora2::common {

namespace {

P<ISonoraPicture> makePicture(int32_t type, const P<peru::IMemoryManager>& memory) {
    switch (type) {
    case ISonoraPicture::kRGB:
        return peru::make<CRGBPicture>(memory);
    case ISonoraPicture::kYUY2:
        return peru::make<CYUY2Picture>(memory);
    case ISonoraPicture::kNV12:
        return peru::make<CNV12Picture>(memory);
    case ISonoraPicture::kYV12:
        return peru::make<CYV12Picture>(memory);
    default:
        throw peru::CRemoteException(
            peru::newString("CSonoraPictureRemote: unknown picture type received 2"));
    }
}

} // namespace

CSonoraPictureRemote::CSonoraPictureRemote(const P<peru::IMemoryManager>& memory, P<ISonoraPicture> picture)
    : m_picture(std::move(picture)), m_memory(memory) {}

CSonoraPictureRemote::~CSonoraPictureRemote() = default;

void CSonoraPictureRemote::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(m_picture ? m_picture->getPictureType() : 0);
    if (m_picture) m_picture->writeTo(stream);
}

void CSonoraPictureRemote::readFrom(const P<peru::IDataInStream>& stream) {
    m_picture.reset();
    const int32_t type = stream->readInt32();
    if (type < ISonoraPicture::kRGB || type > ISonoraPicture::kYV12)
        throw peru::CRemoteException(peru::newString("CSonoraPictureRemote: unknown picture type received"));
    P<ISonoraPicture> picture = makePicture(type, m_memory);
    picture->readFrom(stream);
    m_picture = std::move(picture);
}

P<peru::IString> CSonoraPictureRemote::getPixelShaderName() const {
    return peru::CString::empty();
}

} // namespace sonora2::common
