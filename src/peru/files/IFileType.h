// What the system knows about file types.
#pragma once

#include "peru/files/MimeType.h"

namespace peru {

// Broad categories of files.
enum class EFileCategory { unknown, image, audio, video, text, compressed, system };

// The files of one extension.
class PERU_API IFileType : public virtual IBase {
public:
    virtual P<IString> getExtension() const = 0;   // lower case, without a dot
    virtual P<IString> getDescription() const = 0; // in the user's language
    virtual P<IString> getIconName() const = 0;    // in the user's icon theme
    virtual EFileCategory getCategory() const = 0;
    virtual P<CMimeType> getMimeType() const = 0; // "application/octet-stream" if unknown
};

// Thread-safe.
class PERU_API IFileTypesManager : public virtual IBase {
public:
    // With or without a leading dot; case is ignored.
    virtual P<IFileType> getFileType(const CStringArg& extension) = 0;
    // Such as "Image files"; empty for the unknown category.
    virtual P<IString> getCategoryName(EFileCategory category) = 0;
};

PERU_API P<IFileTypesManager> getFileTypesManager();

} // namespace peru
