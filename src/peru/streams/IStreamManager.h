// Opens any URI.
#pragma once

#include "peru/streams/IStreams.h"

namespace peru {

// How an output or input/output stream treats an existing file.
enum class EOpenMode {
    create,    // created; an existing file is truncated
    createNew, // must not exist
    open,      // must exist
    append,    // opened or created; writing starts at its end
};

// The get forms throw. The try forms return an empty handle for a URI that the factory does not support and
// for a resource that does not exist. A resource that exists but cannot be opened makes both forms throw.
// Factories derive from CStreamFactory, which leaves only a few of these to implement.
class PERU_API IStreamFactory : public virtual IBase {
public:
    virtual P<IInStream> getInStream(const P<IURI>& uri) = 0;
    virtual P<IInStream> tryGetInStream(const P<IURI>& uri) = 0;
    virtual P<IOutStream> getOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IOutStream> tryGetOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IIOStream> getIOStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IIOStream> tryGetIOStream(const P<IURI>& uri, EOpenMode mode) = 0;

    virtual P<IResetableInStream> getResetableInStream(const P<IURI>& uri) = 0;
    virtual P<IResetableInStream> tryGetResetableInStream(const P<IURI>& uri) = 0;
    virtual P<IResetableOutStream> getResetableOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IResetableOutStream> tryGetResetableOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IResetableIOStream> getResetableIOStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<IResetableIOStream> tryGetResetableIOStream(const P<IURI>& uri, EOpenMode mode) = 0;

    virtual P<ISeekableInStream> getSeekableInStream(const P<IURI>& uri) = 0;
    virtual P<ISeekableInStream> tryGetSeekableInStream(const P<IURI>& uri) = 0;
    virtual P<ISeekableOutStream> getSeekableOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<ISeekableOutStream> tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<ISeekableIOStream> getSeekableIOStream(const P<IURI>& uri, EOpenMode mode) = 0;
    virtual P<ISeekableIOStream> tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) = 0;
};

// Asks its factories in order of registration. The get forms throw CURITypeNotSupportedError when no factory
// supports the URI, and CFileNotFoundError for a file that does not exist. Thread-safe: one recursive mutex
// is held while the factories are asked, so opens run one at a time. A factory may open other URIs and add or
// remove factories meanwhile, but must not wait for another thread that uses the manager.
class PERU_API IStreamManager : public virtual IStreamFactory {
public:
    virtual void addFactory(const P<IStreamFactory>& factory) = 0;
    virtual void removeFactory(const P<IStreamFactory>& factory) = 0;
};

PERU_API P<IStreamManager> getStreamManager();

} // namespace peru
