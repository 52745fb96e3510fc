#include "peru/Array.h"
#include "peru/IInstanceWrapper.h"

#include <gtest/gtest.h>

#include <string>

namespace peru {

namespace {

// What a host without these classes knows: a pointer to a table, whose third entry (behind the two forms
// of the destructor) destroys the object; behind it, for a text, the library's own string.
struct STable {
    void (*destruct)(void*);
    void (*destructAndFree)(void*);
    void (*destroy)(void*);
};
struct SText {
    const STable* table;
    std::u16string text;
};

struct CWatched : CObject {
    explicit CWatched(bool& dead) : m_dead(dead) {}
    ~CWatched() override { m_dead = true; }
    bool& m_dead;
};

} // namespace

static_assert(sizeof(CInstanceWrapper) == 2 * sizeof(void*) &&
              sizeof(CStringInstanceWrapper) == sizeof(SText));

TEST(InstanceWrapper, IsReadAndDestroyedThroughItsLayout) {
    for (const std::u16string text :
         {u"", u"sieben7", u"a text that does not fit into the small form \xd83c\xdfb5"}) {
        IInstanceWrapper* wrapper = new CStringInstanceWrapper(text.c_str());
        auto* view = reinterpret_cast<SText*>(wrapper);
        EXPECT_TRUE(view->text == text);
        view->table->destroy(view);
    }
}

TEST(InstanceWrapper, HoldsItsObject) {
    bool dead = false;
    P<CWatched> object = make<CWatched>(dead);
    IInstanceWrapper* wrapper = new CInstanceWrapper(object);
    object.reset();
    EXPECT_FALSE(dead);
    auto* view = reinterpret_cast<SText*>(wrapper);
    view->table->destroy(view);
    EXPECT_TRUE(dead);
}

} // namespace peru
