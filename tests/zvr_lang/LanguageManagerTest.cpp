#include "LanguageSupport.h"
#include "peru/Errors.h"
#include "support/Environment.h"
#include "zvr_lang_manager/InstalledLanguages.h"

#include <gmock/gmock.h>

#include <atomic>
#include <thread>

namespace {

using namespace tests;
using testing::ElementsAre;

class CListener : public peru::CObject, public zvr_lang::ILanguageManagerListener {
public:
    explicit CListener(std::function<void(const std::string&)> action) : m_action(std::move(action)) {}
    void languageChanged(const zvr_lang::SLanguageId& id) override { m_action(text(id.getText())); }

private:
    std::function<void(const std::string&)> m_action;
};

} // namespace

using LanguageManager = CLanguageTest;

TEST_F(LanguageManager, ReplacesTheTextsOfAllPacks) {
    folder.write("peru-de-DE.zvrLang",
                 languageFile(u"de-DE", textBlock({{u"a", u"eins"}, {u"b", u"Entwurf", 1}, {u"c", u""}})));
    folder.write("peru-de-AT.zvrLang", languageFile(u"deu-AT", textBlock({{u"a", u"oans"}})));
    folder.write("other-de-DE.zvrLang", languageFile(u"de-DE", textBlock({{u"a", u"falsch"}})));
    folder.write("peru-fr-FR.txt", languageFile(u"fr-FR", textBlock({{u"a", u"un"}})));
    folder.write("common-fr-FR.zvrLang",
                 languageFile(u"fr-FR", textBlock({{u"d", u"deux"}, {u"d", u"\u00e9t\u00e9"}})));
    std::filesystem::create_directory(folder / "peru-es-ES.zvrLang");
    addPack("peru");
    addPack("common");
    EXPECT_THAT(lines->take(), ElementsAre("Added 'peru' (files=2)", "Added 'common' (files=1)"));

    struct SCase {
        const char* id;
        const char* a;
        const char* d;
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"de-DE", "eins", "default"},
             {"de-AT", "oans", "default"},
             {"de-CH", "oans", "default"},          // the first file of the language
             {"fr-FR", "default", "\u00e9t\u00e9"}, // the last entry of a key counts
             {"fr-CA", "default", "\u00e9t\u00e9"},
             {"en-US", "default", "default"},
         }) {
        setLanguage(c.id);
        EXPECT_EQ(get("a"), c.a) << c.id;
        EXPECT_EQ(get("d"), c.d) << c.id;
        EXPECT_EQ(get("b"), "default") << "a draft";
        EXPECT_EQ(get("c"), "default") << "empty";
        EXPECT_THAT(lines->take(), ElementsAre(c.id, std::string("Setting Language: ") + c.id, c.id));
    }
    EXPECT_THROW(manager->addPack(toURI(folder / "none/"), peru::newString("x"), peru::newString("x-")),
                 peru::CFileError);
    EXPECT_EQ(manager->getPacks().size(), 2u);
}

TEST_F(LanguageManager, LoadsOnlyTheBlocksForItsLanguageAndPack) {
    const std::string austrian = chunk("lang", stringBytes(u"de-AT"));
    const std::string german = chunk("lang", stringBytes(u"deu-DE"));
    folder.write(
        "peru-de-DE.zvrLang",
        languageFile(u"de-DE",
                     textBlock({{u"a", u"1"}, {u"b", u"1"}, {u"c", u"1"}}) +
                         textBlock({{u"a", u"2"}}, austrian) +
                         textBlock({{u"b", u"2"}}, german + chunk("RSID", stringBytes(u"Peru"))) +
                         textBlock({{u"c", u"2"}}, chunk("RSID", stringBytes(u"common"))) +
                         chunk("vers", intBytes(7)) + chunk("cmnt", stringBytes(u"none")) +
                         chunk("xdid", intBytes(2) + stringBytes(u"ZVR_LANG_AUTHOR") + stringBytes(u"me") +
                                           stringBytes(u"other") + stringBytes(u"x"))));
    addPack("peru");
    setLanguage("de-DE");
    EXPECT_EQ(get("a") + get("b") + get("c"), "121");

    const auto& file = manager->getPacks()[0]->getFiles()[0];
    EXPECT_EQ(text(file->getEnglishName()) + text(file->getNativeName()), "LN");
    EXPECT_EQ(text(file->getApplicationId()) + text(file->getApplicationName()), "idname");
    EXPECT_EQ(text(file->getComment()) + text(file->getAuthor()) + std::to_string(file->getVersion()),
              "noneme7");
}

TEST_F(LanguageManager, CallsAllListenersInOrderAfterTheChange) {
    folder.write("peru-de-DE.zvrLang", languageFile(u"de-DE", textBlock({{u"a", u"eins"}})));
    addPack("peru");
    std::vector<std::string> calls;
    peru::P<CListener> first;
    first = peru::make<CListener>([&](const std::string& id) {
        calls.push_back("first " + id + " " + get("a"));
        manager->removeListener(first);
        throw peru::CError("a listener fails");
    });
    manager->addListener(first);
    manager->addListener(
        peru::make<CListener>([&](const std::string& id) { calls.push_back("second " + id); }));
    setLanguage("de-DE");
    setLanguage("ja-JP");
    EXPECT_THAT(calls, ElementsAre("first de-DE eins", "second de-DE", "second ja-JP"));
    EXPECT_EQ(get("a"), "default");
    first.reset();
}

TEST_F(LanguageManager, FindsTheLanguageOfTheLocale) {
    folder.write("peru-de-DE.zvrLang", languageFile(u"de-DE", ""));
    folder.write("peru-haw-US.zvrLang", languageFile(u"haw-US", ""));
    addPack("peru");
    struct SCase {
        const char* all;
        const char* messages;
        const char* lang;
        const char* id;
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"de_AT.UTF-8@euro", "fr_FR", "es_ES", "de-AT"},
             {nullptr, "fr_FR@euro", "es_ES", "fr-FR"},
             {"", "", "es_ES.ISO-8859-1", "es-ES"},
             {nullptr, nullptr, "haw_US", "haw-US"},
             {"de", nullptr, nullptr, "de-DE"},
             {"deu.UTF-8", nullptr, nullptr, "de-DE"},
             {"haw", nullptr, nullptr, "haw-US"},
             {"fr", nullptr, nullptr, ""},
             {"C", nullptr, "de_DE", ""},
             {"C.UTF-8", nullptr, nullptr, ""},
             {"POSIX", nullptr, nullptr, ""},
             {"xx_DE", nullptr, nullptr, ""},
             {"de_XX", nullptr, nullptr, ""},
             {nullptr, nullptr, nullptr, ""},
         }) {
        const CEnvironment all("LC_ALL", c.all);
        const CEnvironment messages("LC_MESSAGES", c.messages);
        const CEnvironment lang("LANG", c.lang);
        lines->take();
        const zvr_lang::SLanguageId id = manager->getSystemLanguage();
        EXPECT_EQ(text(id.getText()), c.id);
        EXPECT_EQ(id.valid, *c.id != 0);
        EXPECT_THAT(lines->take(), ElementsAre("getting system language ID", "LCID: 4096",
                                               id.valid ? std::string("System Language ID: ") + c.id
                                                        : std::string("could not detect systemm language")));
    }
}

TEST_F(LanguageManager, AppliesALocaleThatHasTexts) {
    folder.write("peru-cy-GB.zvrLang", languageFile(u"cy-GB", textBlock({{u"a", u"un"}})));
    const CEnvironment path("TONEWRIGHT_LANG_PATH", folder.path().string());
    for (const char* english : {"", "C", "POSIX", "C.UTF-8", "en_GB", "en-US", "eng.UTF-8", "en@x"}) {
        EXPECT_TRUE(zvr_lang::applyLocale("cy_GB.UTF-8"));
        EXPECT_EQ(get("a"), "un");
        EXPECT_TRUE(zvr_lang::applyLocale(english));
        EXPECT_EQ(get("a"), "default") << english;
    }
    for (const char* unknown : {"eo", "xx_GB", "haw_US"})
        EXPECT_FALSE(zvr_lang::applyLocale(unknown)) << unknown;
}

TEST_F(LanguageManager, LeavesOutDamagedFiles) {
    const std::string good = languageFile(u"de-DE", textBlock({{u"a", u"eins"}, {u"b", u"zwei"}}));
    folder.write("common-de-DE.zvrLang", languageFile(u"de-DE", textBlock({{u"c", u"drei"}})));
    const auto load = [&](const std::string& bytes) {
        folder.write("peru-de-DE.zvrLang", bytes);
        manager = peru::make<zvr_lang::CLanguageManager>();
        addPack("peru");
        addPack("common");
        lines->take();
        setLanguage("de-DE");
        EXPECT_EQ(get("c"), "drei");
    };
    const auto isLogged = [](const std::vector<std::string>& all) {
        return std::ranges::any_of(
            all, [](const std::string& line) { return line.starts_with("error while loading '"); });
    };
    for (size_t size = 0; size < good.size(); ++size) {
        folder.write("peru-de-DE.zvrLang", good.substr(0, size));
        lines->take();
        manager = peru::make<zvr_lang::CLanguageManager>();
        addPack("peru");
        ASSERT_TRUE(isLogged(lines->take())) << size;
        ASSERT_TRUE(manager->getPacks()[0]->getFiles().empty()) << size;
        if (size % 32 == 0) load(good.substr(0, size));
    }
    // A file whose texts are damaged is noticed when they are loaded, and none of them is used.
    std::string late = good;
    late[late.find("data") + 12] = 3; // the number of entries
    load(late);
    EXPECT_TRUE(isLogged(lines->take()));
    EXPECT_EQ(get("a"), "default");

    for (size_t i = 0; i < good.size(); ++i)
        for (const char flip : {'\x01', '\xFF'}) {
            std::string bytes = good;
            bytes[i] ^= flip;
            load(bytes);
        }
}

// The texts are looked up while they are replaced: every message is whole, in one language or another.
TEST_F(LanguageManager, MayChangeWhileOtherThreadsFailAndLog) {
    const char* const key = "peru.CFileNotFoundError.Desc";
    const std::u16string wide(key, key + std::char_traits<char>::length(key));
    folder.write("peru-de-DE.zvrLang", languageFile(u"de-DE", textBlock({{wide, u"'%FILE%' fehlt."}})));
    folder.write("peru-ja-JP.zvrLang", languageFile(u"ja-JP", textBlock({{wide, u"\u7121 '%FILE%'"}})));
    addPack("peru");
    std::atomic<bool> stop = false;
    std::atomic<int> torn = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&] {
            const auto uri = peru::getPathes()->fromPlatformPath("/a");
            while (!stop) {
                const peru::CFileNotFoundError error(uri);
                const std::string description = text(error.getDescription());
                if (description != "'file:///a' fehlt." && description != "\u7121 'file:///a'" &&
                    description != "The file 'file:///a' was not found.")
                    ++torn;
                peru::getLogManager()->logException(peru::newString("test"), error);
            }
        });
    for (int i = 0; i < 60; ++i) setLanguage(i % 3 == 0 ? "de-DE" : i % 3 == 1 ? "ja-JP" : "en-US");
    stop = true;
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(torn, 0);
}
