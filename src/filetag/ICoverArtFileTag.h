// A tag that holds pictures.
#pragma once

#include "filetag/ICoverArt.h"
#include "filetag/IFileTag.h"

namespace filetag {

class FILETAG_API ICoverArtFileTag : public virtual IFileTag {
public:
    virtual int32_t getCoverArtCount() const = 0;
    // Empty when the index lies outside the list.
    virtual P<ICoverArt> getCoverArt(int32_t index) const = 0;
    virtual void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                             EPictureType type) = 0;
    // Puts another picture in the place of the one at the index. Outside the list nothing happens, here and
    // below.
    virtual void replaceCoverArt(int32_t index, const P<peru::CMemoryBlock>& data,
                                 const peru::CStringArg& mimeType, EPictureType type) = 0;
    virtual void removeCoverArt(int32_t index) = 0;
};

} // namespace filetag
