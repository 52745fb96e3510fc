#include "peru/threads/posix/MutexFactory.h"

#include "peru/GlobalObjFactory.h"
#include "peru/threads/posix/GlobalMutexImpl.h"
#include "peru/threads/posix/MutexImpl.h"

namespace peru::posix {

P<IMutex> createPlainMutex() {
    return make<CMutexImpl>();
}

P<IMutex> CMutexFactory::createMutex() {
    return createPlainMutex();
}

P<IMutex> CMutexFactory::createGlobalMutex(const P<IString>& name) {
    return make<CGlobalMutexImpl>(name);
}

} // namespace peru::posix

namespace peru {

P<IMutexFactory> getMutexFactory() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IMutexFactory>(
        key, [] { return P<IMutexFactory>(make<posix::CMutexFactory>()); });
}

} // namespace peru
