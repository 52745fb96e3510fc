#include "peru/threads/ThreadLocalStorage.h"

namespace peru {

CThreadLocalStorage::CThreadLocalStorage()
    : m_manager(getThreadLocalStorageManager()), m_slot(m_manager->createSlot()) {}

CThreadLocalStorage::~CThreadLocalStorage() {
    m_manager->removeSlot(m_slot);
}

P<IBase> CThreadLocalStorage::get() const {
    return m_manager->get(m_slot);
}

void CThreadLocalStorage::set(const P<IBase>& value) {
    m_manager->set(m_slot, value);
}

} // namespace peru
