// A tag that can hold pictures.
#pragma once

#include "filetag/ICoverArt.h"
#include "filetag/IFileTag.h"

namespace filetag {

class FILETAG_API ICoverArtFileTag : public virtual IFileTag {
public:
    virtual int32_t getCoverArtCount() const = 0;
    // Returns an empty handle if the index is out of range.
    virtual P<ICoverArt> getCoverArt(int32_t index) const = 0;
    virtual void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                             EPictureType type) = 0;
    // Replaces the picture at the index. replaceCoverArt and removeCoverArt do nothing if the index is out of
    // range.
    virtual void replaceCoverArt(int32_t index, const P<peru::CMemoryBlock>& data,
                                 const peru::CStringArg& mimeType, EPictureType type) = 0;
    virtual void removeCoverArt(int32_t index) = 0;
};

} // namespace filetag
