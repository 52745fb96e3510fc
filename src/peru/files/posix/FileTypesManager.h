// Kinds of files as the desktop knows them.
#pragma once

#include "peru/files/IFileType.h"

namespace peru::posix {

// Answers from the desktop's table of content types.
class CFileTypesManager : public CObject, public IFileTypesManager {
public:
    ~CFileTypesManager() override;
    P<IFileType> getFileType(const CStringArg& extension) override;
    P<IString> getCategoryName(EFileCategory category) override;
};

} // namespace peru::posix
