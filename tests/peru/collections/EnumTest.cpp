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
std::string drain(const P<IConstEnum>& elements) {
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

} // namespace

TEST(Enum, WalksToTheEndAndThrowsThere) {
    P<CConstArray> constant =
        make<CConstArray>(std::vector<PC<IBase>>{P<IBase>(newString("x")), P<IBase>(newString("y"))});
    for (int32_t index : {-1, 2}) EXPECT_THROW(constant->getConstAt(index), CInvalidArgError);
    P<CConstMultiEnum> constChain =
        make<CConstMultiEnum>(std::vector<P<IConstEnum>>{makeArray("ab")->createConstEnum(), nullptr});
    constChain->addEnum(makeArray("cd")->createConstEnum(true));
    const std::pair<P<IConstEnum>, std::string> cases[] = {
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
        {constChain, "abdc"},
    };
    for (const auto& [elements, expected] : cases) {
        SCOPED_TRACE(expected);
        EXPECT_EQ(elements->getCount(), std::ssize(expected));
        for (int round = 0; round < 2; ++round) {
            EXPECT_EQ(drain(elements), expected);
            EXPECT_THROW(elements->getNextConst(), CEndOfEnumError);
            if (auto typed = tryCast<IEnum>(elements)) {
                EXPECT_THROW(typed->getNext(), CEndOfEnumError);
            }
            EXPECT_FALSE(elements->hasMore());
            elements->reset();
        }
    }
    WEnum<IString> none;
    EXPECT_FALSE(none.hasMore());
    EXPECT_THROW(none.getNext(), CEndOfEnumError);
    none.reset();
}

TEST(Array, EditsByIndexAndRefusesOthers) {
    P<CArray> array = makeArray("ac");
    P<IEnum> elements = array->createEnum(); // sees the changes
    P<IBase> b = newString("b");
    array->insertAt(1, b);
    array->insertAt(3, newString("d"));
    array->setAt(0, newString("A"));
    EXPECT_EQ(drain(elements), "Abcd");
    EXPECT_TRUE(array->remove(b));
    EXPECT_FALSE(array->remove(b));
    EXPECT_EQ(drain(array->createEnum()), "Acd");
    const std::function<void(int32_t)> operations[] = {
        [&](int32_t index) { array->getAt(index); }, [&](int32_t index) { array->getConstAt(index); },
        [&](int32_t index) { array->setAt(index, b); }, [&](int32_t index) { array->removeAt(index); },
        [&](int32_t index) { array->insertAt(index < 0 ? index : index + 1, b); }};
    for (const auto& operation : operations)
        for (int32_t index : {-1, 3}) EXPECT_THROW(operation(index), CInvalidArgError);
    elements->reset();
    elements->getNext();
    array->clear();
    EXPECT_FALSE(elements->hasMore());
}

} // namespace peru
