#include "peru/streams/StreamFactory.h"

#include "peru/Errors.h"

namespace peru {

CStreamFactory::~CStreamFactory() = default;

void CStreamFactory::reportMissing(const P<IURI>& uri) const {}

template <class S> P<S> CStreamFactory::orThrow(P<S> stream, const P<IURI>& uri) const {
    if (!stream) {
        reportMissing(uri);
        throw CURITypeNotSupportedError(uri);
    }
    return stream;
}

P<IInStream> CStreamFactory::getInStream(const P<IURI>& uri) {
    return orThrow(tryGetInStream(uri), uri);
}

P<IInStream> CStreamFactory::tryGetInStream(const P<IURI>& uri) {
    return tryGetResetableInStream(uri);
}

P<IOutStream> CStreamFactory::getOutStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetOutStream(uri, mode), uri);
}

P<IOutStream> CStreamFactory::tryGetOutStream(const P<IURI>& uri, EOpenMode mode) {
    return tryGetResetableOutStream(uri, mode);
}

P<IIOStream> CStreamFactory::getIOStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetIOStream(uri, mode), uri);
}

P<IIOStream> CStreamFactory::tryGetIOStream(const P<IURI>& uri, EOpenMode mode) {
    return tryGetResetableIOStream(uri, mode);
}

P<IResetableInStream> CStreamFactory::getResetableInStream(const P<IURI>& uri) {
    return orThrow(tryGetResetableInStream(uri), uri);
}

P<IResetableInStream> CStreamFactory::tryGetResetableInStream(const P<IURI>& uri) {
    return tryGetSeekableInStream(uri);
}

P<IResetableOutStream> CStreamFactory::getResetableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetResetableOutStream(uri, mode), uri);
}

P<IResetableOutStream> CStreamFactory::tryGetResetableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return tryGetSeekableOutStream(uri, mode);
}

P<IResetableIOStream> CStreamFactory::getResetableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetResetableIOStream(uri, mode), uri);
}

P<IResetableIOStream> CStreamFactory::tryGetResetableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return tryGetSeekableIOStream(uri, mode);
}

P<ISeekableInStream> CStreamFactory::getSeekableInStream(const P<IURI>& uri) {
    return orThrow(tryGetSeekableInStream(uri), uri);
}

P<ISeekableInStream> CStreamFactory::tryGetSeekableInStream(const P<IURI>& uri) {
    return nullptr;
}

P<ISeekableOutStream> CStreamFactory::getSeekableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetSeekableOutStream(uri, mode), uri);
}

P<ISeekableOutStream> CStreamFactory::tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return nullptr;
}

P<ISeekableIOStream> CStreamFactory::getSeekableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return orThrow(tryGetSeekableIOStream(uri, mode), uri);
}

P<ISeekableIOStream> CStreamFactory::tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return nullptr;
}

} // namespace peru
