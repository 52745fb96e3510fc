// Opens any URI.
#pragma once

#include "peru/streams/IStreams.h"

namespace peru {

// How an output or input/output stream treats what is already there.
enum class EOpenMode {
    create,    // made anew; an existing file is emptied
    createNew, // must not exist
    open,      // must exist
    append,    // opened or made; writing starts at its end
};

// The get forms throw. The try forms answer an empty handle for a URI that the factory does not know, and
// where there is nothing by that name; what is there and cannot be opened throws from both. Factories derive
// from CStreamFactory, which needs few of these.
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

// Asks its factories in the order of registration; the throwing forms throw CURITypeNotSupportedError when
// none knows the URI, and CFileNotFoundError for a file that does not exist. Safe from any thread: one mutex
// is held for the walk, a factory's open included.
class PERU_API IStreamManager : public virtual IStreamFactory {
public:
    virtual void addFactory(const P<IStreamFactory>& factory) = 0;
    virtual void removeFactory(const P<IStreamFactory>& factory) = 0;
};

PERU_API P<IStreamManager> getStreamManager();

} // namespace peru
