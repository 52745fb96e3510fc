#include "peru/collections/SimpleHashTable.h"
#include "peru/strings/String.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <string>

namespace peru {

// Compared with std::map over many edits, with keys in mixed encodings.
TEST(SimpleHashTable, AgreesWithAMap) {
    std::mt19937 random(20);
    for (size_t size : {1u, 17u}) {
        TSimpleHashTable<P<IString>, int> table(size);
        const int* fixed = &table.set(newString("fixed"), 1);
        std::map<std::string, int> model;
        for (int i = 0; i < 4000; ++i) {
            std::string name = "peru.key" + std::to_string(random() % 300);
            P<IString> key = CString::fromUTF8(name);
            if (random() % 2) key = key->toUTF16String();
            if (random() % 3) {
                table.set(key, i);
                model[name] = i;
            } else {
                EXPECT_EQ(table.remove(*key), model.erase(name) == 1) << name;
            }
            if (i == 2000) {
                EXPECT_EQ(table.find(*newString("fixed")), fixed) << "a value keeps its address";
                table.clear();
                model.clear();
            }
            ASSERT_EQ(table.getCount(), model.size() + (i < 2000));
        }
        for (const auto& [name, value] : model) {
            const int* found = table.find(*CString::fromUTF8(name));
            ASSERT_TRUE(found) << name;
            EXPECT_EQ(*found, value) << name;
        }
        std::map<std::string, int> walked;
        table.forEach([&](const P<IString>& key, int value) { walked[CString::toStdString(key)] = value; });
        EXPECT_EQ(walked, model);
        EXPECT_EQ(table.find(*newString("peru.key300")), nullptr);
    }
}

} // namespace peru
