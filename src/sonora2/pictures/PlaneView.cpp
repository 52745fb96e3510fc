#include "sonora2/pictures/PlaneView.h"

#include "peru/Errors.h"
#include "peru/ISerializable.h"

namespace sonora2::common {

CPlaneView::CPlaneView(const P<peru::IMemoryBlock>& block, int64_t offset, int64_t size)
    : m_block(block), m_offset(offset), m_capacity(size), m_size(size) {}

CPlaneView::~CPlaneView() = default;

void CPlaneView::setSize(int64_t size) {
    if (size < 0 || size > m_capacity) throw peru::CInvalidArgError("size", "CPlaneView::setSize");
    m_size = size;
}

void CPlaneView::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(static_cast<int32_t>(m_size));
    stream->write(getData(), m_size);
}

void CPlaneView::readFrom(const P<peru::IDataInStream>& stream) {
    setSize(stream->readInt32());
    stream->read(getData(), m_size);
}

} // namespace sonora2::common
