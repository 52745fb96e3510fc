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
    P<IValueStore> openStore(const P<IURI>&, EStoreAccess) override { return m_store; }
    const P<IValueStore> m_store =
        make<CXmlValueStore>(make<CXmlDocument>(), nullptr, EStoreAccess::read, EMode::elements, false);
};

} // namespace

TEST(ValueStore, values_ComeBackFromTheFileInBothModes) {
    const CTempFolder folder;
    const std::string long_ = "  two\n\n lines & <more>\t\xF0\x9F\x98\x80 \xE0\xA4\x95 ";
    const CEnvironment config("XDG_CONFIG_HOME", folder.path().string());
    for (const std::string kind : {"", "@", "registry"}) {
        const P<IURI> uri = tests::toURI(folder / (kind.empty() ? "deep/a.xml" : "b.xml"));
        const auto open = [&](EStoreAccess access) -> P<IValueStore> {
            if (kind == "registry") return openRegistry("registry:///HKEY_USERS/A/", access);
            return CXmlValueStore::open(uri, access, kind.empty() ? EMode::elements : EMode::attributes);
        };
        P<IValueStore> store = open(EStoreAccess::readWrite);
        store->setString("", "1st Try", CString::fromUTF8(long_));
        store->setInt("Tone/-4 dB", "1 x", -1);
        store->setInt64("Tone", "big", int64_t{1} << 60);
        store->setBool("Tone", "on", true);
        store->setBool("Tone", "off", false);
        store->setDouble("Tone", "gain", 0.1);
        store->setString("Tone", "empty", "");
        store->setString("Tone", "word", "maybe");
        EXPECT_EQ(std::filesystem::exists(tests::toPath(uri)), kind == "registry")
            << "left by the kind before";
        store->flush();

        store = open(EStoreAccess::read);
        const P<IString> first = store->getString("", "1st Try", nullptr);
        EXPECT_EQ(text(first->toUTF8String()), long_);
        EXPECT_EQ(store->getInt("Tone/-4 dB", "1 x", 0), -1);
        EXPECT_EQ(store->getInt64("/Tone/", "big", 0), int64_t{1} << 60);
        EXPECT_TRUE(store->getBool("Tone", "on", false));
        EXPECT_EQ(store->getDouble("Tone", "gain", 0), 0.1);
        EXPECT_EQ(store->getInt("Tone", "empty", 7), 7);
        for (const char* name : {"none", "empty"})
            EXPECT_EQ(text(store->getString("Tone", name, newString("else"))), "else");
        EXPECT_TRUE(store->getBool("Tone", "word", true));
        EXPECT_FALSE(store->getBool("Tone", "word", false));
        EXPECT_FALSE(store->getBool("Tone", "off", true));
        for (const bool fallback : {false, true})
            EXPECT_EQ(store->getBool("Tone", "none", fallback), fallback);
        EXPECT_EQ(store->getInt64("none", "big", 8), 8);
        EXPECT_EQ(store->getDouble("Tone", "none", 0.5), 0.5);
        EXPECT_EQ(errorOf([&] { store->getInt("Tone", "big", 0); }), "Error parsing integer.");
        EXPECT_TRUE(store->hasValue("Tone", "empty"));
        EXPECT_FALSE(store->hasValue("Tone", "-4 dB"));
        EXPECT_TRUE(store->hasSection("Tone/-4 dB"));
        EXPECT_FALSE(store->hasSection("Tone/gain"));
        EXPECT_EQ(join(store->getValueNames("Tone")), "big;on;off;gain;empty;word;");
        EXPECT_EQ(join(store->getValueNames("")), "1st Try;");
        EXPECT_EQ(join(store->getSectionNames("")), "Tone;");
        EXPECT_EQ(join(store->getSectionNames("Tone")).substr(0, 6), "-4 dB;");
        EXPECT_EQ(join(store->getValueNames("none")), "");
        EXPECT_THROW(store->setInt("", "a", 1), CReadOnlyError);
        EXPECT_THROW(store->removeSection("Tone"), CReadOnlyError);

        if (kind == "registry") {
            open(EStoreAccess::readWrite)->removeSection("Tone");
            EXPECT_FALSE(store->hasSection("Tone"));
            break;
        }
        const auto judged = tests::run({"xmllint", "--xpath",
                                        "string(/settings/Tone/__L__-4__32__dB/" + kind + "__L__1__32__x)",
                                        tests::toPath(uri)});
        EXPECT_EQ(judged.out, "-1\n") << judged.err;
    }
}

TEST(ValueStore, remove_LeavesTheRest) {
    const CTempFolder folder;
    for (const EMode mode : {EMode::elements, EMode::attributes}) {
        const P<IURI> uri = tests::toURI(folder / (mode == EMode::elements ? "a.xml" : "b.xml"));
        const auto store = CXmlValueStore::open(uri, EStoreAccess::readWrite, mode);
        EXPECT_FALSE(store->hasSection(""));
        store->setInt("a", "b", 1);
        store->setInt("a/b", "c", 2); // a section of the same name
        store->setInt("a", "d", 3);
        store->setInt("x", "y", 1);
        store->setInt("x/y", "z", 2);
        EXPECT_EQ(join(store->getValueNames("a")) + join(store->getSectionNames("a")), "b;d;b;");
        // Each change reaches the file by itself.
        const auto reopen = [&] {
            store->flush();
            const auto found = CXmlValueStore::open(uri, EStoreAccess::read, mode);
            std::filesystem::remove(tests::toPath(uri));
            store->flush();
            EXPECT_FALSE(std::filesystem::exists(tests::toPath(uri))) << "nothing has changed";
            return found;
        };
        for (const char* name : {"b", "none"}) store->removeValue("a", name);
        auto found = reopen();
        EXPECT_FALSE(found->hasValue("a", "b"));
        EXPECT_EQ(found->getInt("a/b", "c", 0) + found->getInt("a", "d", 0), 5);
        EXPECT_THROW(found->removeValue("a", "d"), CReadOnlyError);
        for (const char* section : {"none/none", "a"}) store->removeSection(section);
        EXPECT_FALSE(reopen()->hasSection("a"));
        store->removeSection("x/y");
        found = reopen();
        EXPECT_FALSE(found->hasSection("x/y"));
        EXPECT_TRUE(found->hasValue("x", "y"));
        store->removeSection("");
        EXPECT_TRUE(reopen()->hasSection("")) << "as the root of the file";
        EXPECT_FALSE(store->hasSection("x"));
    }
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
    EXPECT_THROW(manager->openStore(nullptr, EStoreAccess::read), CInvalidArgError);
    EXPECT_THROW(manager->addFactory(nullptr), CInvalidArgError);
    // The factory that was added first answers, until it is removed.
    const P<IURI> uri = make<CURI>("memory:a");
    std::vector<P<CMemoryFactory>> factories = {make<CMemoryFactory>(), make<CMemoryFactory>()};
    for (const auto& factory : factories) manager->addFactory(factory);
    for (const auto& factory : factories) {
        const P<IValueStore> store = manager->openStore(uri, EStoreAccess::read);
        manager->removeFactory(factory);
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
