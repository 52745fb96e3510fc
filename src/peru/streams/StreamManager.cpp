#include "peru/streams/StreamManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/net/HTTPStreamFactory.h"
#include "peru/streams/posix/DiskStreamFactory.h"

namespace peru {

CStreamManager::CStreamManager() : m_mutex(getMutexFactory()->createMutex()), m_factories(10, 1) {
    m_factories.add(make<posix::CDiskStreamFactory>());
    m_factories.add(make<net::CHTTPStreamFactory>());
}

CStreamManager::~CStreamManager() = default;

void CStreamManager::addFactory(const P<IStreamFactory>& factory) {
    if (!factory) throw CInvalidArgError("factory", "CStreamManager::addFactory");
    CMutexLock lock(m_mutex);
    m_factories.add(factory);
}

void CStreamManager::removeFactory(const P<IStreamFactory>& factory) {
    CMutexLock lock(m_mutex);
    for (size_t i = 0; i < m_factories.getCount(); ++i)
        if (m_factories[i] == factory) {
            m_factories.removeAt(i);
            return;
        }
}

void CStreamManager::reportMissing(const P<IURI>& uri) const {
    CMutexLock lock(m_mutex);
    for (size_t i = 0; i < m_factories.getCount(); ++i)
        if (const P<CStreamFactory> speaking = tryCast<CStreamFactory>(m_factories[i]))
            speaking->reportMissing(uri);
}

template <class S, class... A> P<S>
CStreamManager::askEach(P<S> (IStreamFactory::*open)(const P<IURI>&, A...), const P<IURI>& uri, A... mode) {
    if (!uri) throw CInvalidArgError("uri", "IStreamManager");
    CMutexLock lock(m_mutex);
    // By index and holding a reference: a factory may add or remove factories while it is asked.
    for (size_t i = 0; i < m_factories.getCount(); ++i) {
        const P<IStreamFactory> factory = m_factories[i];
        if (P<S> stream = (factory.get()->*open)(uri, mode...)) return stream;
    }
    return nullptr;
}

P<IInStream> CStreamManager::tryGetInStream(const P<IURI>& uri) {
    return askEach(&IStreamFactory::tryGetInStream, uri);
}

P<IOutStream> CStreamManager::tryGetOutStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetOutStream, uri, mode);
}

P<IIOStream> CStreamManager::tryGetIOStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetIOStream, uri, mode);
}

P<IResetableInStream> CStreamManager::tryGetResetableInStream(const P<IURI>& uri) {
    return askEach(&IStreamFactory::tryGetResetableInStream, uri);
}

P<IResetableOutStream> CStreamManager::tryGetResetableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetResetableOutStream, uri, mode);
}

P<IResetableIOStream> CStreamManager::tryGetResetableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetResetableIOStream, uri, mode);
}

P<ISeekableInStream> CStreamManager::tryGetSeekableInStream(const P<IURI>& uri) {
    return askEach(&IStreamFactory::tryGetSeekableInStream, uri);
}

P<ISeekableOutStream> CStreamManager::tryGetSeekableOutStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetSeekableOutStream, uri, mode);
}

P<ISeekableIOStream> CStreamManager::tryGetSeekableIOStream(const P<IURI>& uri, EOpenMode mode) {
    return askEach(&IStreamFactory::tryGetSeekableIOStream, uri, mode);
}

P<IStreamManager> getStreamManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IStreamManager>(
        key, []() -> P<IStreamManager> { return make<CStreamManager>(); });
}

} // namespace peru
