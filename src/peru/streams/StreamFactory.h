// The base of stream factories.
#pragma once

#include "peru/Object.h"
#include "peru/streams/IStreamManager.h"
#include "peru/uri/IURI.h"

namespace peru {

// A factory overrides the try forms of the most able streams that it has: each try form asks the more able
// ones below it, and the throwing forms ask the try forms.
class PERU_API CStreamFactory : public CObject, public virtual IStreamFactory {
public:
    ~CStreamFactory() override;

    // Throws what the factory has to say about a URI for which its try forms answered nothing, such as
    // CFileNotFoundError; returns when it does not know such URIs at all.
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
