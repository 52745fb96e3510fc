#include "peru/Errors.h"
#include "peru/collections/Array.h"
#include "peru/collections/Enums.h"
#include "peru/strings/String.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>

namespace peru {

namespace {

P<CArray> makeArray(const std::string& letters) {
    P<CArray> array = make<CArray>();
    for (char letter : letters) array->add(newString(std::string(1, letter).c_str()));
    return array;
}

// The remaining elements as one text.
std::string drain(const P<IEnum>& elements) {
    std::string all;
    for (WEnum<IString> typed(elements); typed.hasMore();) all += CString::toStdString(typed.getNext());
    return all;
}

std::string drainConst(const P<IConstEnum>& elements) {
    std::string all;
    while (elements->hasMore())
        all += CString::toStdString(*PC<IString>(P<const IString>(elements->getNextConst())));
    return all;
}

P<IEnum> chain(const std::vector<std::string>& parts) {
    P<CMultiEnum> multi = make<CMultiEnum>();
    for (const std::string& letters : parts) multi->addEnum(makeArray(letters)->createEnum());
    return multi;
}

P<IConstEnum> chainConst(const std::string& a, const std::string& b) {
    return make<CConstMultiEnum>(std::vector<P<IConstEnum>>{makeArray(a)->createConstEnum(), P<IConstEnum>(),
                                                            makeArray(b)->createConstEnum(true)});
}

} // namespace

TEST(Enum, WalksToTheEndAndThrowsThere) {
    P<CConstArray> constant =
        make<CConstArray>(std::vector<PC<IBase>>{P<IBase>(newString("x")), P<IBase>(newString("y"))});
    const struct {
        P<IConstEnum> elements;
        const char* expected;
    } cases[] = {
        {make<CEmptyEnum>(), ""},
        {makeArray("")->createEnum(), ""},
        {makeArray("")->createConstEnum(true), ""},
        {makeArray("abc")->createEnum(), "abc"},
        {makeArray("abc")->createEnum(true), "cba"},
        {makeArray("abc")->createConstEnum(true), "cba"},
        {constant->createConstEnum(), "xy"},
        {constant->createConstEnum(true), "yx"},
        {chain({"", "", ""}), ""},
        {chain({"ab", "", "c"}), "abc"},
        {chainConst("ab", "cd"), "abdc"},
    };
    for (const auto& each : cases) {
        SCOPED_TRACE(each.expected);
        EXPECT_EQ(each.elements->getCount(), static_cast<int32_t>(std::string(each.expected).size()));
        for (int round = 0; round < 2; ++round) {
            EXPECT_EQ(drainConst(each.elements), each.expected);
            EXPECT_THROW(each.elements->getNextConst(), CEndOfEnumError);
            if (auto typed = tryCast<IEnum>(each.elements)) {
                EXPECT_THROW(typed->getNext(), CEndOfEnumError);
            }
            EXPECT_FALSE(each.elements->hasMore());
            each.elements->reset();
        }
    }
}

TEST(Enum, TypedViewOfNothingIsEmpty) {
    WEnum<IString> none;
    EXPECT_FALSE(none.hasMore());
    EXPECT_THROW(none.getNext(), CEndOfEnumError);
    none.reset();
}

TEST(Enum, SeesTheChangesOfItsArray) {
    P<CArray> array = makeArray("abcd");
    P<IEnum> elements = array->createEnum();
    elements->getNext();
    array->removeAt(1);
    EXPECT_EQ(drain(elements), "cd");
    array->add(newString("e"));
    EXPECT_EQ(drain(elements), "e");
    array->clear();
    EXPECT_FALSE(elements->hasMore());
}

TEST(Array, EditsByIndexAndRefusesOthers) {
    P<CArray> array = makeArray("ac");
    P<IBase> b = newString("b");
    array->insertAt(1, b);
    array->insertAt(3, newString("d"));
    array->setAt(0, newString("A"));
    EXPECT_EQ(drain(array->createEnum()), "Abcd");
    EXPECT_TRUE(array->remove(b));
    EXPECT_FALSE(array->remove(b));
    EXPECT_EQ(drain(array->createEnum()), "Acd");
    const std::function<void(int32_t)> operations[] = {
        [&](int32_t index) { array->getAt(index); }, [&](int32_t index) { array->getConstAt(index); },
        [&](int32_t index) { array->setAt(index, b); }, [&](int32_t index) { array->removeAt(index); },
        [&](int32_t index) { array->insertAt(index < 0 ? index : index + 1, b); }};
    for (const auto& operation : operations)
        for (int32_t index : {-1, 3}) EXPECT_THROW(operation(index), CInvalidArgError);
}

} // namespace peru
