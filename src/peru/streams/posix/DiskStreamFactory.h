// The factory of the streams over files.
#pragma once

#include "peru/streams/StreamFactory.h"

namespace peru::posix {

// Knows the "file" scheme. The try forms answer nothing for a file that does not exist; the throwing ones
// throw CFileNotFoundError for it. A file that exists and cannot be opened throws from both.
class PERU_API CDiskStreamFactory : public CStreamFactory {
public:
    ~CDiskStreamFactory() override;
    void reportMissing(const P<IURI>& uri) const override;
    P<ISeekableInStream> tryGetSeekableInStream(const P<IURI>& uri) override;
    P<ISeekableOutStream> tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableIOStream> tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) override;
};

} // namespace peru::posix
