// One thread-local pointer.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IThreadLocalStorage.h"

#include <pthread.h>

namespace peru::posix {

class CSimpleThreadLocalStorage : public CObject, public ISimpleThreadLocalStorage {
public:
    CSimpleThreadLocalStorage(); // throws CError
    ~CSimpleThreadLocalStorage() override;
    CSimpleThreadLocalStorage(const CSimpleThreadLocalStorage&) = delete;
    CSimpleThreadLocalStorage& operator=(const CSimpleThreadLocalStorage&) = delete;

    void* get() const override;
    void set(void* value) override;

private:
    pthread_key_t m_key;
};

class CSimpleThreadLocalStorageFactory : public CObject, public ISimpleThreadLocalStorageFactory {
public:
    P<ISimpleThreadLocalStorage> createStorage() override;
};

} // namespace peru::posix
