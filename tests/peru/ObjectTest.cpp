#include "peru/Errors.h"
#include "peru/IInterfaceQuery.h"
#include "peru/collections/FrailArray.h"
#include "support/Files.h"

#include <functional>
#include <thread>
#include <vector>

namespace peru {

namespace {

class INamed : public virtual IBase {
public:
    virtual int getNumber() const = 0;
};

class IOther : public virtual IBase {};

// Counts its destruction.
class CProbe : public CObject, public INamed {
public:
    explicit CProbe(int& destructions, std::function<void(CProbe&)> atEnd = {})
        : m_destructions(destructions), m_atEnd(std::move(atEnd)) {}
    ~CProbe() override {
        ++m_destructions;
        if (m_atEnd) m_atEnd(*this);
    }
    int getNumber() const override { return 7; }

private:
    int& m_destructions;
    std::function<void(CProbe&)> m_atEnd;
};

// Represents other objects, as a buffered stream represents the file below it.
class CRelay : public CObject, public IInterfaceQuery {
public:
    SInterfaceQueryResult queryInterface(const std::type_info&) override { return m_answer; }
    SInterfaceQueryResult m_answer;
};

class CNamedRelay : public CRelay, public INamed {
public:
    explicit CNamedRelay(int number) : m_number(number) {}
    int getNumber() const override { return m_number; }

private:
    int m_number;
};

} // namespace

static_assert(sizeof(P<INamed>) == sizeof(void*) && sizeof(PC<INamed>) == sizeof(void*));
static_assert(std::is_convertible_v<P<CProbe>, P<INamed>> && !std::is_convertible_v<P<INamed>, P<IOther>>);
static_assert(std::is_constructible_v<P<IOther>, P<INamed>> && !std::is_convertible_v<INamed*, P<INamed>>);
static_assert(std::is_convertible_v<P<CProbe>, PC<INamed>> &&
              !std::is_constructible_v<P<INamed>, PC<INamed>>);

TEST(Handle, DestroysWithTheLastOne) {
    int destroyed = 0;
    P<CProbe> first = make<CProbe>(destroyed);
    P<CProbe>& alias = first;
    first = alias;
    P<INamed> second = first;
    PC<INamed> constant = second;
    P<IBase> shared = P<IBase>::share(first.get());
    second = std::move(second);
    EXPECT_EQ(second->getNumber(), 7);
    first = nullptr;
    shared.reset();
    second = P<INamed>();
    EXPECT_EQ(destroyed, 0);
    EXPECT_EQ(constant->getNumber(), 7);
    PC<INamed> moved = std::move(constant);
    EXPECT_FALSE(constant);
    moved = PC<INamed>();
    EXPECT_EQ(destroyed, 1);
}

TEST(Handle, MovesOverItsOwnLastOwner) {
    // The old object holds the handle that the new one comes from.
    struct CNode : CObject {
        P<CNode> next;
    };
    P<CNode> list = make<CNode>();
    list->next = make<CNode>();
    CNode* second = list->next.get();
    list = std::move(list->next);
    EXPECT_EQ(list.get(), second);
}

TEST(Handle, RefusesAnInterfaceThatTheObjectLacks) {
    int destroyed = 0;
    {
        P<IBase> object = make<CProbe>(destroyed);
        EXPECT_EQ(P<INamed>(object)->getNumber(), 7);
        EXPECT_FALSE(P<IOther>(P<INamed>()) || tryCast<IOther>(object));
        EXPECT_EQ(tests::errorOf<CCastError>([&] { P<IOther> other(object); }),
                  "Error casting a 'peru::(anonymous namespace)::CProbe' object to "
                  "'peru::(anonymous namespace)::IOther'");
        EXPECT_EQ(destroyed, 0);
    }
    EXPECT_EQ(destroyed, 1);
}

TEST(Object, CountsFromSeveralThreadsAndWhileItDies) {
    int destroyed = 0;
    P<CProbe> probe = make<CProbe>(destroyed, [](CProbe& dying) {
        for (int i = 0; i < 3; ++i) P<IBase> stray = P<IBase>::share(&dying);
    });
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([own = probe] {
            for (int k = 0; k < 20000; ++k) P<INamed> copy = own;
        });
    probe.reset();
    for (std::thread& thread : threads) thread.join();
    threads.clear();
    EXPECT_EQ(destroyed, 1);
}

TEST(Frail, HoldsOnlyWithItsFlag) {
    int destroyed = 0;
    P<CProbe> probe = make<CProbe>(destroyed);
    PFrail<INamed> loose(probe.get(), false);
    PFrail<INamed> counted(probe.get(), true);
    EXPECT_EQ(loose, counted);
    PFrail<INamed> copy = counted;
    counted = loose;
    EXPECT_FALSE(counted.isCounted());
    probe.reset();
    EXPECT_EQ(destroyed, 0);
    copy = PFrail<INamed>();
    EXPECT_EQ(destroyed, 1);
}

TEST(FrailArray, StandsAListenerThatLeavesWhileItDies) {
    int destroyed = 0;
    P<TFrailArray<INamed>> list = make<TFrailArray<INamed>>();
    P<CProbe> second = make<CProbe>(destroyed);
    P<CProbe> third = make<CProbe>(destroyed);
    list->addCounted(make<CProbe>(destroyed, [&](CProbe&) { list->remove(second.get()); }));
    list->add(second.get());
    list->add(third.get());
    EXPECT_TRUE(list->remove(list->at(0)));
    EXPECT_EQ(destroyed, 1);
    ASSERT_EQ(list->getCount(), 1u);
    EXPECT_EQ(list->at(0), third.get());
}

TEST(InterfaceCast, AsksDelegateThenObjectThenParts) {
    auto named = [](int number) { return make<CNamedRelay>(number); };
    P<CRelay> bottom = make<CRelay>();
    bottom->m_answer.aggregated = {P<IBase>(), P<IBase>(make<CRelay>()), P<IBase>(named(1)),
                                   P<IBase>(named(2))};
    EXPECT_EQ(interfaceCast<INamed>(bottom)->getNumber(), 1);

    P<CNamedRelay> own = named(3);
    own->m_answer.aggregated = {P<IBase>(named(4))};
    EXPECT_EQ(interfaceCast<INamed>(own)->getNumber(), 3);
    own->m_answer.delegate = bottom;
    EXPECT_EQ(interfaceCast<INamed>(own)->getNumber(), 1);

    EXPECT_FALSE(interfaceCast<IOther>(own));
    EXPECT_FALSE(interfaceCast<IOther>(nullptr));
}

TEST(InterfaceCast, EndsInACycle) {
    P<CRelay> top = make<CRelay>();
    P<CRelay> bottom = make<CRelay>();
    top->m_answer.delegate = bottom;
    bottom->m_answer = {top, {P<IBase>(top), P<IBase>(make<CNamedRelay>(5))}};
    EXPECT_FALSE(interfaceCast<IOther>(top));
    EXPECT_EQ(interfaceCast<INamed>(top)->getNumber(), 5);
    bottom->m_answer = {};
}

} // namespace peru
