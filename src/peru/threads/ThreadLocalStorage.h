// A slot for one counted object per thread.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IThreadLocalStorage.h"
#include "peru/threads/ThreadLocalStorageManager.h"

namespace peru {

class PERU_API CThreadLocalStorage : public CObject, public IThreadLocalStorage {
public:
    CThreadLocalStorage();
    ~CThreadLocalStorage() override;

    P<IBase> get() const override;
    void set(const P<IBase>& value) override;

private:
    P<CThreadLocalStorageManager> m_manager;
    uint64_t m_slot;
};

} // namespace peru
