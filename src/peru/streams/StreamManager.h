// The stream manager.
#pragma once

#include "peru/collections/SimpleArray.h"
#include "peru/streams/StreamFactory.h"
#include "peru/threads/IMutex.h"

namespace peru {

// Contains the factories for files and for HTTP from the start.
class PERU_API CStreamManager : public CStreamFactory, public IStreamManager {
public:
    CStreamManager();
    ~CStreamManager() override;

    void addFactory(const P<IStreamFactory>& factory) override;
    void removeFactory(const P<IStreamFactory>& factory) override;
    void reportMissing(const P<IURI>& uri) const override;

    P<IInStream> tryGetInStream(const P<IURI>& uri) override;
    P<IOutStream> tryGetOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IIOStream> tryGetIOStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IResetableInStream> tryGetResetableInStream(const P<IURI>& uri) override;
    P<IResetableOutStream> tryGetResetableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<IResetableIOStream> tryGetResetableIOStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableInStream> tryGetSeekableInStream(const P<IURI>& uri) override;
    P<ISeekableOutStream> tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) override;
    P<ISeekableIOStream> tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) override;

private:
    template <class S, class... A>
    P<S> askEach(P<S> (IStreamFactory::*open)(const P<IURI>&, A...), const P<IURI>& uri, A... mode);

    P<IMutex> m_mutex; // guards the array and is held while the factories are asked
    TCleaningSimpleArray<P<IStreamFactory>> m_factories;
};

} // namespace peru
