// Creates streams over files.
#pragma once

#include "peru/streams/StreamFactory.h"

namespace peru::posix {

// Supports the "file" scheme. For a file that does not exist the try forms return nothing and the get forms
// throw CFileNotFoundError. A file that exists but cannot be opened makes both throw.
class PERU_API CDiskStreamFactory : public CStreamFactory {
public:
    ~CDiskStreamFactory() override;
    void reportMissing(const P<IURI>& uri) const override;
    P<ISeekableInStream> tryGetSeekableInStream(const P<IURI>& uri) override;
    P<ISeekableOutStream> tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableIOStream> tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) override;
};

} // namespace peru::posix
