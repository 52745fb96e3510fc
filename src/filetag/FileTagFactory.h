// Selects the tag class for a file.
#pragma once

#include "filetag/IFileTag.h"
#include "peru/Object.h"

namespace filetag {

// A singleton of the global object factory. May be used from any thread once the temporary extension is set.
class FILETAG_API CFileTagFactory : public peru::CObject {
public:
    static P<CFileTagFactory> get();

    CFileTagFactory();
    ~CFileTagFactory() override;

    // Returns the opened tag of a file, selected by its extension regardless of case: mp3, wav, flac, ogg,
    // wma or asf. Returns an empty handle for any other extension. Throws what IFileTag::open throws.
    P<IFileTag> create(const P<peru::IURI>& file);

    // Suffix of files still being written, such as ".part": it is removed before the extension is compared.
    void setTempExtension(const P<peru::IString>& extension);

private:
    P<peru::IString> m_tempExtension;
};

} // namespace filetag
