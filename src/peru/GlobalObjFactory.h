// The owner of the process's singletons.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

#include <deque>
#include <memory>
#include <thread>
#include <unordered_map>
#include <vector>

namespace peru {

// Singletons are made on demand and die in the reverse order of the completion of their construction:
// at shutdown(), or at process end. A request after process end stops the program.
class PERU_API CGlobalObjFactory : public CObject {
public:
    // One static key word per accessor: its address names the singleton.
    struct SKey {
        char word = 0;
    };

    // Knows a singleton without its type.
    class PERU_API IPtrHolder {
    public:
        virtual ~IPtrHolder() = default;
        virtual void destroy() = 0;
        virtual void* getPtr() = 0;
    };

    template <class T> class CPtrHolderImpl : public IPtrHolder {
    public:
        explicit CPtrHolderImpl(P<T> object) : m_object(std::move(object)) {}
        void destroy() override { delete this; }
        void* getPtr() override { return &m_object; }

    private:
        P<T> m_object;
    };

    // The one T of the process. The factory function runs with the re-entrant mutex held, so that it
    // may ask for other singletons; when it throws nothing is entered and the next request tries again.
    template <class T> static P<T> get(const SKey& key, P<T> (*create)()) {
        P<CGlobalObjFactory> factory = instance();
        CMutexLock lock(factory->m_mutex);
        if (IPtrHolder* holder = factory->find(key)) return *static_cast<P<T>*>(holder->getPtr());
        P<T> object = create();
        factory->enter(key, std::make_unique<CPtrHolderImpl<T>>(object));
        return object;
    }

    // Destroys all singletons, last made first. The factory stays: what is asked for later is made anew, and
    // what is asked for meanwhile dies with the rest. The mutex is free while a singleton dies, so that it
    // may wait for threads which need other singletons.
    static void shutdown();

protected:
    CGlobalObjFactory();
    ~CGlobalObjFactory() override;

private:
    struct SEntry {
        const SKey* key;
        IPtrHolder* holder;
    };
    struct SDying {
        SEntry entry;
        std::thread::id thread;
    };

    static P<CGlobalObjFactory> instance();
    IPtrHolder* find(const SKey& key) const;
    void enter(const SKey& key, std::unique_ptr<IPtrHolder> holder);
    void clear();

    P<IMutex> m_mutex; // guards the members below, and is held while a singleton is made
    std::unordered_map<const SKey*, IPtrHolder*> m_holders;
    std::deque<SEntry> m_creationOrder;
    // A singleton that asks for itself while it dies gets itself; for other threads it is gone.
    std::vector<SDying> m_dying;

    friend struct SGlobalObjFactoryCell;
};

} // namespace peru
