// The library as modules use it that load it on first use.
#pragma once

#include "filetag/IFileTag.h"
#include "filetag/TagTransfer.h"

namespace filetag {

// The functions of the same names; see FileTagFactory.h and TagTransfer.h.
class FILETAG_API ILibrary : public virtual peru::IBase {
public:
    virtual P<IFileTag> createTag(const P<peru::IURI>& file) = 0;
    virtual void setTempExtension(const P<peru::IString>& extension) = 0;
    virtual STags readAllTags(const P<peru::IURI>& file) = 0;
    virtual STransferReport addTags(const P<peru::IURI>& file, const STags& tags) = 0;
    virtual bool changeTags(const P<peru::IURI>& file, const STagChange& change) = 0;
};

// The function "filetag_getLibrary" that the library exports.
using GetLibraryFunction = void (*)(P<ILibrary>& library);
inline constexpr const char* kGetLibraryName = "filetag_getLibrary";

} // namespace filetag
