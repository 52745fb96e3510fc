#include "peru/media/posix/System.h"
#include "peru/GlobalObjFactory.h"
#include "peru/media/ISystem.h"

namespace peru::media {

namespace {

// A host's replacement for the machine's devices.
class CReplacement : public CObject {
public:
    P<ISystem> get() const {
        CMutexLock lock(m_mutex);
        return m_system;
    }
    void set(P<ISystem> system) {
        CMutexLock lock(m_mutex);
        m_system.swap(system); // the old one is released with the argument, after the lock
    }

private:
    const P<IMutex> m_mutex = getMutexFactory()->createMutex(); // guards the handle
    P<ISystem> m_system;
};

P<CReplacement> getReplacement() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<CReplacement>(key, [] { return make<CReplacement>(); });
}

} // namespace

P<ISystem> getSystem() {
    static const CGlobalObjFactory::SKey key;
    if (P<ISystem> replacement = getReplacement()->get()) return replacement;
    return CGlobalObjFactory::get<ISystem>(key, [] { return P<ISystem>(make<posix::CSystem>()); });
}

void setSystem(const P<ISystem>& system) {
    getReplacement()->set(system);
}

} // namespace peru::media
