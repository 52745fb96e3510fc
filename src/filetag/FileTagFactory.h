// Picks the tag class for a file.
#pragma once

#include "filetag/IFileTag.h"
#include "peru/Object.h"

namespace filetag {

// A singleton of the global object factory. Any thread, once the temporary extension is set.
class FILETAG_API CFileTagFactory : public peru::CObject {
public:
    static P<CFileTagFactory> get();

    CFileTagFactory();
    ~CFileTagFactory() override;

    // The opened tag of a file, by its extension in any case: mp3, wav, flac, ogg, wma and asf. Empty for any
    // other extension. Throws what IFileTag::open throws.
    P<IFileTag> create(const P<peru::IURI>& file);

    // An ending of file names under work, such as ".part": it is cut off before the extension is compared.
    void setTempExtension(const P<peru::IString>& extension);

private:
    P<peru::IString> m_tempExtension;
};

} // namespace filetag
