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

// Singletons are created on demand and destroyed in the reverse order of the completion of their
// construction, by shutdown() or by an exit handler. A request after that handler has run aborts the program.
class PERU_API CGlobalObjFactory : public CObject {
public:
    // One static key per accessor; its address identifies the singleton.
    struct SKey {
        char word = 0;
    };

    // Owns a singleton without knowing its type.
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

    // Returns the process's only T. `create` runs with the re-entrant mutex held, so it may request other
    // singletons. If it throws, nothing is registered and the next request tries again.
    template <class T> static P<T> get(const SKey& key, P<T> (*create)()) {
        P<CGlobalObjFactory> factory = instance();
        CMutexLock lock(factory->m_mutex);
        if (IPtrHolder* holder = factory->find(key)) return *static_cast<P<T>*>(holder->getPtr());
        P<T> object = create();
        factory->enter(key, std::make_unique<CPtrHolderImpl<T>>(object));
        return object;
    }

    // Destroys all singletons, last created first. The factory stays usable: a later request creates the
    // singleton again, and one created during shutdown is destroyed with the rest. The mutex is not held
    // while a singleton is destroyed, so its destructor may wait for threads that need other singletons.
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

    P<IMutex> m_mutex; // guards the members below; also held while a singleton is created
    std::unordered_map<const SKey*, IPtrHolder*> m_holders;
    std::deque<SEntry> m_creationOrder;
    // A singleton that requests itself from its own destructor gets itself; other threads no longer see it.
    std::vector<SDying> m_dying;

    friend struct SGlobalObjFactoryCell;
};

} // namespace peru
