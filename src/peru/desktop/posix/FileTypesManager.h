// File types as known to the desktop.
#pragma once

#include "peru/files/IFileType.h"

namespace peru::posix {

// Uses the desktop's database of content types.
class CFileTypesManager : public CObject, public IFileTypesManager {
public:
    ~CFileTypesManager() override;
    P<IFileType> getFileType(const CStringArg& extension) override;
    P<IString> getCategoryName(EFileCategory category) override;
};

} // namespace peru::posix
