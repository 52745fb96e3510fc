#include "host/Program.h"

#include <gmock/gmock.h>

using namespace tests;
using testing::HasSubstr;
using testing::Not;

class Language : public CProgramTest {
protected:
    void SetUp() override {
        if (!std::filesystem::exists(TONEWRIGHT_LANGUAGES)) GTEST_SKIP() << "no language files were built";
    }
    SProcessResult inLocale(const std::string& locale, std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), kProgram);
        auto environment = programEnvironment();
        environment.emplace_back("LC_ALL", "");
        environment.emplace_back("LC_MESSAGES", "");
        environment.emplace_back("LANG", locale);
        return run(arguments, folder.path(), environment);
    }
};

TEST_F(Language, IsThatOfTheOptionOrTheEnvironment) {
    struct SCase {
        const char* locale;
        std::vector<std::string> options;
        const char* text;
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"", {}, "No such file"},
             {"en_GB.UTF-8", {}, "No such file"},
             {"nonsense", {}, "No such file"},
             {"de_AT.UTF-8@euro", {}, "Die Datei ist leer"},
             {"de", {}, "Die Datei ist leer"},
             {"C", {"--lang", "de"}, "Die Datei ist leer"},
             {"de_DE", {"--lang=fr-CA"}, "Le fichier est vide"},
             {"ja_JP.UTF-8", {}, "ファイルが空です"},
             {"de_DE", {"--lang", "en"}, "The file is empty"},
         }) {
        std::vector<std::string> arguments = c.options;
        const bool isEnglish = std::string_view(c.text) == "No such file";
        folder.write("empty.wav", "");
        arguments.insert(arguments.end(), {"info", isEnglish ? "none.wav" : "empty.wav"});
        const SProcessResult result = inLocale(c.locale, arguments);
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.err, HasSubstr(c.text)) << c.locale;
    }
    const SProcessResult unknown = inLocale("de", {"--lang", "xx", "formats"});
    EXPECT_EQ(unknown.exitCode, 2);
    EXPECT_THAT(unknown.err, HasSubstr("language xx"));
}

// The library's messages, those of plug-ins, and help; not the names of options and keys of JSON.
TEST_F(Language, AppliesToAllTextsButNotToWhatProgramsRead) {
    folder.write("bad.flac", std::string(5000, 'x'));
    EXPECT_THAT(inLocale("de_DE", {"info", "bad.flac"}).err,
                HasSubstr("bad.flac: Lesen nicht möglich: kein FLAC"));
    EXPECT_THAT(inLocale("es_ES", {"info", "none.xyz"}).err, Not(HasSubstr("No plug-in")));
    const std::string help = inLocale("de_DE", {"convert", "--help"}).out;
    EXPECT_THAT(help, HasSubstr("Vorhandene Dateien ersetzen"));
    EXPECT_THAT(help, HasSubstr("--force"));
    EXPECT_THAT(help, Not(HasSubstr("Options:")));
    write("in.wav", makeTone(44100, 1, 16, 0.1));
    EXPECT_THAT(inLocale("de_DE", {"convert", "in.wav", "-o", "out.flac"}).out, HasSubstr("-fache Echtzeit"));
    const auto events = parseLines(inLocale("de_DE", {"convert", "--json", "in.wav", "-o", "in.wav"}).out);
    ASSERT_FALSE(events.empty());
    EXPECT_EQ(events.back()["event"], "error");
    EXPECT_EQ(events.back()["message"], "Eingabe und Ausgabe sind dieselbe Datei");
}

TEST_F(Language, IsThatOfThePartsOfTheParser) {
    const struct {
        const char *command, *german, *english;
    } cases[] = {
        {"get", "ADDRESS ist erforderlich", "ADDRESS is required"},
        {"info --nonsense x", "Argument wurde nicht erwartet: --nonsense",
         "argument was not expected: --nonsense"},
        {"convert x --to wav --rate 0", "0 liegt nicht zwischen 1 und 768000\n",
         "0 is not in the range 1 to 768000\n"},
        {"convert x --to wav --bits 9", "--bits: 9 ist keines von", "--bits: 9 is not one of"},
        {"get x -o", "--output: der Wert fehlt", "--output: the value is missing"},
        {"rip --pick 1", "--pick erfordert --cddb", "--pick requires --cddb"},
        {"cddb --no-cache --refresh --toc 1,2 --server x", "schließt", "excludes"},
    };
    for (const auto& each : cases) {
        const SProcessResult german = inLocale("de_DE", words(each.command));
        EXPECT_EQ(german.exitCode, 2);
        EXPECT_THAT(german.err, HasSubstr(each.german));
        EXPECT_THAT(inLocale("C", words(each.command)).err, HasSubstr(each.english));
    }
}
