#include "peru/threads/posix/SimpleThreadLocalStorage.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"

namespace peru::posix {

namespace {

void check(int error) {
    if (error == 0) return;
    throw CError(localize("peru.CSimpleThreadLocalStorage.error",
                          "Error using thread local storage (%ERRORDESC%).",
                          {{"%ERRORDESC%", getSystemText(error)}}));
}

} // namespace

CSimpleThreadLocalStorage::CSimpleThreadLocalStorage() {
    check(pthread_key_create(&m_key, nullptr));
}

CSimpleThreadLocalStorage::~CSimpleThreadLocalStorage() {
    pthread_key_delete(m_key);
}

void* CSimpleThreadLocalStorage::get() const {
    return pthread_getspecific(m_key);
}

void CSimpleThreadLocalStorage::set(void* value) {
    check(pthread_setspecific(m_key, value));
}

P<ISimpleThreadLocalStorage> CSimpleThreadLocalStorageFactory::createStorage() {
    return make<CSimpleThreadLocalStorage>();
}

} // namespace peru::posix

namespace peru {

P<ISimpleThreadLocalStorageFactory> getSimpleThreadLocalStorageFactory() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<ISimpleThreadLocalStorageFactory>(key, [] {
        return P<ISimpleThreadLocalStorageFactory>(make<posix::CSimpleThreadLocalStorageFactory>());
    });
}

} // namespace peru
