// The manager of value stores.
#pragma once

#include "peru/Object.h"
#include "peru/collections/SimpleArray.h"
#include "peru/settings/IValueStoreManager.h"
#include "peru/threads/IMutex.h"

#include <initializer_list>

namespace peru {

class PERU_API CValueStoreManager : public CObject, public IValueStoreManager {
public:
    explicit CValueStoreManager(std::initializer_list<P<IValueStoreFactory>> factories);
    ~CValueStoreManager() override;

    P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess access) override;
    void addFactory(const P<IValueStoreFactory>& factory) override;
    void removeFactory(const P<IValueStoreFactory>& factory) override;

private:
    P<IMutex> m_mutex; // guards the array; also held while the factories are called
    TCleaningSimpleArray<P<IValueStoreFactory>> m_factories;
};

} // namespace peru
