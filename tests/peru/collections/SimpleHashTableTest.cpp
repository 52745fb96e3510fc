#include "peru/collections/Bucket.h"
#include "peru/collections/ValueList.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <string>

namespace peru {

// The table and the list over it, compared with std::map over many edits, with keys in mixed encodings.
TEST(SimpleHashTable, AgreesWithAMap) {
    std::mt19937 random(20);
    for (size_t size : {1u, 17u}) {
        TSimpleHashTable<P<IString>, int> table(size);
        const int* fixed = &table.set(newString("fixed"), 1);
        std::map<std::string, int> model;
        const P<IValueList> list = make<CValueList>();
        for (int i = 0; i < 4000; ++i) {
            std::string name = "peru.key" + std::to_string(random() % 300);
            P<IString> key = CString::fromUTF8(name);
            if (random() % 2) key = key->toUTF16String();
            if (random() % 3) {
                table.set(key, i);
                model[name] = i;
                list->setValue(key, key);
            } else {
                EXPECT_EQ(table.remove(*key), model.erase(name) == 1) << name;
                list->removeValue(key);
            }
            if (i == 2000) {
                EXPECT_EQ(table.find(*newString("fixed")), fixed) << "a value keeps its address";
                table.clear();
                model.clear();
                list->clear();
            }
            ASSERT_EQ(table.getCount(), model.size() + (i < 2000));
        }
        for (const auto& [name, value] : model) {
            const int* found = table.find(*CString::fromUTF8(name));
            ASSERT_TRUE(found) << name;
            EXPECT_EQ(*found, value) << name;
            EXPECT_TRUE(P<IString>(list->getValue(newString(name.c_str())))->equals(name.c_str()));
        }
        int32_t count = 0;
        for (WEnum<IString> names = list->getNames(); names.hasMore(); ++count)
            EXPECT_TRUE(model.contains(CString::toStdString(names.getNext())));
        EXPECT_EQ(count, static_cast<int32_t>(model.size()));
        EXPECT_EQ(list->getCount(), count);
        EXPECT_FALSE(list->hasValue("peru.key300") || list->getValue("peru.key300"));
        std::map<std::string, int> walked;
        table.forEach([&](const P<IString>& key, int value) { walked[CString::toStdString(key)] = value; });
        EXPECT_EQ(walked, model);
        EXPECT_EQ(table.find(*newString("peru.key300")), nullptr);
    }
}

TEST(PartitionedBucket, KeepsItsPartitionsApart) {
    const P<CPartitionedBucket> bucket = make<CPartitionedBucket>();
    const P<IBase> a = newString("a"), b = newString("b");
    bucket->setObjectOf("", "name", a);
    bucket->setObjectOf("part", u"name", b);
    EXPECT_EQ(bucket->getObject(u"name"), a);
    EXPECT_EQ(bucket->getPartition("part")->getObject("name"), b);
    EXPECT_FALSE(bucket->getObjectOf("none", "name"));
    EXPECT_EQ(bucket->getObjectOf("", "name"), a);
    ASSERT_EQ(bucket->getPartitionKeys().size(), 1u) << "a look-up creates none";
    EXPECT_TRUE(bucket->getPartitionKeys()[0]->equals("part"));
    EXPECT_TRUE(bucket->getNames().at(0)->equals("name"));
    bucket->setObject("name", nullptr);
    EXPECT_FALSE(bucket->hasObject("name"));
    EXPECT_EQ(bucket->getObjectOf("part", "name"), b);
    bucket->setObject("name", a);
    bucket->clear();
    EXPECT_TRUE(bucket->getNames().empty() && bucket->getPartitionKeys().empty());
}

} // namespace peru
