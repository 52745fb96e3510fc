#include "peru/streams/posix/DiskStreamFactory.h"

#include "peru/Errors.h"
#include "peru/streams/posix/DiskStreams.h"

namespace peru::posix {

namespace {

bool isFile(const P<IURI>& uri) {
    return uri->getScheme()->equalsIgnoreCase("file");
}

template <class Stream> P<Stream> tryMake(const P<IURI>& uri, EAccess access, EOpenMode mode) {
    if (!isFile(uri)) return nullptr;
    std::unique_ptr<CDiskFile> file = CDiskFile::tryOpen(uri, access, mode);
    return file ? make<Stream>(std::move(file)) : nullptr;
}

} // namespace

CDiskStreamFactory::~CDiskStreamFactory() = default;

void CDiskStreamFactory::reportMissing(const P<IURI>& uri) const {
    if (isFile(uri)) throw CFileNotFoundError(uri);
}

P<ISeekableInStream> CDiskStreamFactory::tryGetSeekableInStream(const P<IURI>& uri) {
    return tryMake<CDiskInStream>(uri, EAccess::read, EOpenMode::open);
}

P<ISeekableOutStream> CDiskStreamFactory::tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return tryMake<CDiskOutStream>(uri, EAccess::write, mode);
}

P<ISeekableIOStream> CDiskStreamFactory::tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return tryMake<CDiskIOStream>(uri, EAccess::readWrite, mode);
}

} // namespace peru::posix
