#include "peru/settings/XmlValueStore.h"

#include "peru/uri/URI.h"
#include "peru/xml/XmlDocument.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <thread>

using namespace peru;
using tests::CEnvironment;
using tests::CTempFolder;
using tests::errorOf;
using tests::text;

namespace {

using EMode = CXmlValueStore::EMode;

std::string join(WEnum<IString> names) {
    std::string all;
    while (names.hasMore()) all += text(names.getNext()->toUTF8String()) + ";";
    return all;
}

P<IValueStore> openRegistry(const char* key, EStoreAccess access = EStoreAccess::readWrite) {
    return getValueStoreManager()->openStore(make<CURI>(key), access);
}

// Answers for every URI with one store.
class CMemoryFactory : public CObject, public IValueStoreFactory {
public:
    P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess) override {
        return m_store = make<CXmlValueStore>(make<CXmlDocument>(), uri, EStoreAccess::read, EMode::elements,
                                              false);
    }
    P<IValueStore> m_store;
};

} // namespace

TEST(ValueStore, values_ComeBackFromTheFileInBothModes) {
    const CTempFolder folder;
    const std::string long_ = "  two\n\n lines & <more>\t\xF0\x9F\x98\x80 \xE0\xA4\x95 ";
    for (EMode mode : {EMode::elements, EMode::attributes}) {
        const P<IURI> uri = tests::toURI(folder / (mode == EMode::elements ? "deep/a.xml" : "b.xml"));
        P<IValueStore> store = CXmlValueStore::open(uri, EStoreAccess::readWrite, mode);
        store->setString("", "1st Try", CString::fromUTF8(long_));
        store->setInt("Tone/-4 dB", "-1", -1);
        store->setInt64("Tone", "big", int64_t{1} << 60);
        store->setBool("Tone", "on", true);
        store->setDouble("Tone", "gain", 0.1);
        store->setString("Tone", "empty", "");
        store->setString("Tone", "word", "maybe");
        EXPECT_FALSE(std::filesystem::exists(tests::toPath(uri)));
        store->flush();

        store = CXmlValueStore::open(uri, EStoreAccess::read, mode);
        const P<IString> first = store->getString("", "1st Try", nullptr);
        EXPECT_EQ(text(first->toUTF8String()), long_);
        EXPECT_EQ(store->getInt("Tone/-4 dB", "-1", 0), -1);
        EXPECT_EQ(store->getInt64("/Tone/", "big", 0), int64_t{1} << 60);
        EXPECT_TRUE(store->getBool("Tone", "on", false));
        EXPECT_EQ(store->getDouble("Tone", "gain", 0), 0.1);
        EXPECT_EQ(store->getInt("Tone", "empty", 7), 7);
        EXPECT_EQ(text(store->getString("Tone", "none", newString("else"))), "else");
        EXPECT_TRUE(store->getBool("Tone", "word", true));
        EXPECT_FALSE(store->getBool("Tone", "word", false));
        EXPECT_EQ(errorOf([&] { store->getInt("Tone", "big", 0); }), "Error parsing integer.");
        EXPECT_TRUE(store->hasValue("Tone", "empty"));
        EXPECT_FALSE(store->hasValue("Tone", "-4 dB"));
        EXPECT_TRUE(store->hasSection("Tone/-4 dB"));
        EXPECT_FALSE(store->hasSection("Tone/gain"));
        EXPECT_EQ(join(store->getValueNames("Tone")), "big;on;gain;empty;word;");
        EXPECT_EQ(join(store->getValueNames("")), "1st Try;");
        EXPECT_EQ(join(store->getSectionNames("")), "Tone;");
        EXPECT_EQ(join(store->getSectionNames("Tone")).substr(0, 6), "-4 dB;");
        EXPECT_EQ(join(store->getValueNames("none")), "");
        EXPECT_THROW(store->setInt("", "a", 1), CReadOnlyError);
        EXPECT_THROW(store->removeSection("Tone"), CReadOnlyError);

        const char* place = mode == EMode::elements ? "/settings/Tone/__L__-4__32__dB/__L__-1"
                                                    : "/settings/Tone/__L__-4__32__dB/@__L__-1";
        const auto judged =
            tests::run({"xmllint", "--xpath", std::string("string(") + place + ")", tests::toPath(uri)});
        EXPECT_EQ(judged.out, "-1\n") << judged.err;
    }
    EXPECT_NE(tests::readFile(folder / "deep/a.xml").find("<__L__1st__32__Try>"), std::string::npos);
}

TEST(ValueStore, remove_LeavesTheRest) {
    const CTempFolder folder;
    const P<IURI> uri = tests::toURI(folder / "a.xml");
    const auto store = CXmlValueStore::open(uri, EStoreAccess::readWrite);
    store->setInt("a", "b", 1);
    store->setInt("a/b", "c", 2); // a section of the same name
    store->setInt("a", "d", 3);
    for (const char* name : {"b", "none"}) store->removeValue("a", name);
    EXPECT_FALSE(store->hasValue("a", "b"));
    EXPECT_EQ(store->getInt("a/b", "c", 0), 2);
    for (const char* section : {"none/none", "a"}) store->removeSection(section);
    EXPECT_FALSE(store->hasSection("a"));
    store->setInt("x", "y", 1);
    store->removeSection("");
    EXPECT_EQ(join(store->getSectionNames("")), "");
    store->flush();
    EXPECT_FALSE(CXmlValueStore::open(uri, EStoreAccess::read)->hasSection("x"));
}

TEST(ValueStore, files_AreReplacedAndNeverSpoiled) {
    const CTempFolder folder;
    // A file that cannot be read is not overwritten.
    const auto bad = folder.write("bad.xml", "<settings><a>1</a>");
    EXPECT_THROW(CXmlValueStore::open(tests::toURI(bad), EStoreAccess::readWrite), CParseError);
    EXPECT_EQ(tests::readFile(bad), "<settings><a>1</a>");
    EXPECT_FALSE(CXmlValueStore::open(tests::toURI(folder.write("empty.xml", "")), EStoreAccess::read)
                     ->hasValue("", "a"));

    // Foreign content is kept; the store saves automatically.
    const auto file = folder.write("real.xml", "<!-- mine --><top other='1'><a>1</a></top>");
    const P<IURI> uri = tests::toURI(file);
    const auto store = CXmlValueStore::open(uri, EStoreAccess::readWrite, EMode::elements, true);
    store->setInt("", "a", 2);
    EXPECT_EQ(tests::readFile(file), "<?xml version=\"1.0\" encoding=\"UTF-8\" ?>\n<!-- mine -->\n"
                                     "<top other=\"1\">\n    <a>2</a>\n</top>\n");

    // A file that cannot be written keeps its content, the store its changes.
    std::filesystem::remove(file);
    std::filesystem::create_directory(file);
    EXPECT_THROW(store->setInt("", "a", 3), CFileError);
    std::filesystem::remove(file);
    store->flush();
    EXPECT_EQ(CXmlValueStore::open(uri, EStoreAccess::read)->getInt("", "a", 0), 3);

    // Names and texts that the file could not hold.
    for (const char16_t* name : {u"", u"a<b", u"a/b", u"&", u"\uFEFFa"})
        EXPECT_THROW(store->setInt("new", name, 1), CInvalidArgError) << text(newString(name));
    EXPECT_THROW(store->setInt(u"\uFEFFnew", "b", 1), CInvalidArgError);
    EXPECT_THROW(store->setInt("new/a>", "b", 1), CInvalidArgError);
    EXPECT_THROW(store->setString("new", "b", "\x01"), CInvalidArgError);
    EXPECT_FALSE(store->hasSection("new"));
}

TEST(ValueStore, manager_OpensWhatItKnows) {
    const CTempFolder folder;
    const auto manager = getValueStoreManager();
    EXPECT_FALSE(manager->openStore(tests::toURI(folder / "a.txt"), EStoreAccess::readWrite));
    EXPECT_FALSE(manager->openStore(make<CURI>("http://a/b.xml"), EStoreAccess::readWrite));
    EXPECT_TRUE(manager->openStore(tests::toURI(folder / "a.XML"), EStoreAccess::readWrite));
    // The factory that was added first answers, until it is removed.
    const P<IURI> uri = make<CURI>("memory:a");
    std::vector<P<CMemoryFactory>> factories = {make<CMemoryFactory>(), make<CMemoryFactory>()};
    for (const auto& factory : factories) manager->addFactory(factory);
    for (const auto& factory : factories) {
        const P<IValueStore> store = manager->openStore(uri, EStoreAccess::read);
        manager->removeFactory(factory);
        ASSERT_TRUE(store);
        EXPECT_EQ(store, factory->m_store);
    }
    EXPECT_FALSE(manager->openStore(uri, EStoreAccess::read));
}

TEST(ValueStore, registry_KeysShareOneFile) {
    const CTempFolder folder;
    const CEnvironment config("XDG_CONFIG_HOME", folder.path().string());
    EXPECT_EQ(errorOf([] { openRegistry("registry:HKEY_NONE/Software"); }),
              "Unknown registry base key: HKEY_NONE");
    EXPECT_EQ(errorOf([] { openRegistry("registry:HKEY_USER"); }), "Unknown registry base key: HKEY_USER");

    const auto whole = openRegistry("registry:HKEY_CURRENT_USER", EStoreAccess::read);
    const auto other = openRegistry("registry:HKEY_LOCAL_MACHINE/Software/One");
    // Stores in several threads do not lose each other's changes.
    std::vector<std::thread> threads;
    for (const char* key :
         {"registry:HKEY_CURRENT_USER/Software/One", "registry:HKEY_CURRENT_USER/Software/Two%20b"})
        threads.emplace_back([key] {
            const auto store = openRegistry(key);
            for (int i = 0; i < 20; ++i) store->setInt("", CString::fromUTF8("v" + std::to_string(i)), i);
            store->removeValue("", "v0");
        });
    for (std::thread& thread : threads) thread.join();
    for (const char* section : {"Software/One", "Software/Two b"}) {
        EXPECT_EQ(whole->getValueNames(section).getCount(), 19) << section;
        EXPECT_EQ(whole->getInt(section, "v19", 0), 19);
    }
    EXPECT_THROW(whole->setBool("", "a", true), CReadOnlyError);
    EXPECT_FALSE(other->hasSection(""));
    EXPECT_TRUE(std::filesystem::exists(folder / "tonewright/registry/HKEY_CURRENT_USER.xml"));
}
