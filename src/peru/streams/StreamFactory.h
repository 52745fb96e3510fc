// Base class of stream factories.
#pragma once

#include "peru/Object.h"
#include "peru/streams/IStreamManager.h"
#include "peru/uri/IURI.h"

namespace peru {

// A factory overrides the try forms for its most capable streams: every other try form falls back to the next
// more capable one, and the get forms call the try forms.
class PERU_API CStreamFactory : public CObject, public virtual IStreamFactory {
public:
    ~CStreamFactory() override;

    // Called when the try forms returned nothing for the URI: throws the reason, such as CFileNotFoundError,
    // or returns if the factory does not support this kind of URI.
    virtual void reportMissing(const P<IURI>& uri) const;

    P<IInStream> getInStream(const P<IURI>& uri) override;
    P<IInStream> tryGetInStream(const P<IURI>& uri) override;
    P<IOutStream> getOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IOutStream> tryGetOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IIOStream> getIOStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IIOStream> tryGetIOStream(const P<IURI>& uri, EOpenMode mode) override;

    P<IResetableInStream> getResetableInStream(const P<IURI>& uri) override;
    P<IResetableInStream> tryGetResetableInStream(const P<IURI>& uri) override;
    P<IResetableOutStream> getResetableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IResetableOutStream> tryGetResetableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IResetableIOStream> getResetableIOStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IResetableIOStream> tryGetResetableIOStream(const P<IURI>& uri, EOpenMode mode) override;

    P<ISeekableInStream> getSeekableInStream(const P<IURI>& uri) override;
    P<ISeekableInStream> tryGetSeekableInStream(const P<IURI>& uri) override;
    P<ISeekableOutStream> getSeekableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableOutStream> tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableIOStream> getSeekableIOStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableIOStream> tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) override;

private:
    template <class S> P<S> orThrow(P<S> stream, const P<IURI>& uri) const;
};

} // namespace peru
