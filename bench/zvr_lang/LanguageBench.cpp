// Loading of a language, and look-ups compared with those of gettext.
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"
#include "zvr_lang_manager/LanguageManager.h"

#include <benchmark/benchmark.h>

#include <clocale>
#include <cstdlib>
#include <filesystem>
#include <libintl.h>
#include <new>
#include <string>

using namespace peru;

namespace {

size_t s_allocations = 0;

constexpr const char* kKey = "peru.CFileNotFoundError.Desc";
constexpr const char* kDefault = "The file '%FILE%' was not found.";

P<zvr_lang::CLanguageManager> makeManager() {
    P<zvr_lang::CLanguageManager> manager = make<zvr_lang::CLanguageManager>();
    const P<IURI> folder = getPathes()->fromPlatformPath(LANGUAGE_FOLDER "/");
    for (const char* name : {"common", "peru"})
        manager->addPack(folder, newString(name), newString(name) + "-");
    return manager;
}

void setLanguage(const P<zvr_lang::CLanguageManager>& manager, const char* id) {
    manager->setCurrentLanguage(zvr_lang::findLanguageId(id, zvr_lang::ELanguageIdKind::languageAndCountry));
}

void loadLanguage(benchmark::State& state, const char* id) {
    const P<zvr_lang::CLanguageManager> manager = makeManager();
    for (auto _ : state) setLanguage(manager, id);
    if (getStringLocalizer()->getText(kKey, CString::empty())->isEmpty())
        state.SkipWithError("no translation");
}

void listFiles(benchmark::State& state) {
    for (auto _ : state) benchmark::DoNotOptimize(makeManager());
}

void lookUp(benchmark::State& state) {
    setLanguage(makeManager(), state.range(0) ? "de-DE" : "en-US");
    const P<IStringLocalizer> localizer = getStringLocalizer();
    const P<IString> defaultText = newString(kDefault);
    const size_t before = s_allocations;
    for (auto _ : state) benchmark::DoNotOptimize(localizer->getText(kKey, defaultText));
    state.counters["allocations"] =
        static_cast<double>(s_allocations - before) / static_cast<double>(state.iterations());
}

// The same text from a catalogue that msgfmt has made.
void lookUpByGettext(benchmark::State& state) {
    const std::filesystem::path root = std::filesystem::temp_directory_path() / "tonewright-bench-locale";
    const std::filesystem::path folder = root / "de/LC_MESSAGES";
    std::filesystem::create_directories(folder);
    const std::string command =
        "msgfmt " TRANSLATIONS_FOLDER "/de.po -o '" + (folder / "tonewright.mo").string() + "'";
    if (std::system(command.c_str()) != 0) return state.SkipWithError("msgfmt failed");
    ::setenv("LANGUAGE", "de", 1);
    std::setlocale(LC_ALL, "C.UTF-8");
    ::bindtextdomain("tonewright", root.c_str());
    // Catalogues have the context in front of the text.
    const std::string id = std::string(kKey) + '\4' + kDefault;
    if (::dgettext("tonewright", id.c_str()) == id) state.SkipWithError("no translation");
    for (auto _ : state) benchmark::DoNotOptimize(::dgettext("tonewright", id.c_str()));
    std::filesystem::remove_all(root);
}

} // namespace

// Not inlined: the compiler would see malloc and delete as a mismatch.
[[gnu::noinline]] void* operator new(size_t size) {
    ++s_allocations;
    if (void* memory = std::malloc(size)) return memory;
    throw std::bad_alloc();
}
[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, size_t) noexcept {
    std::free(memory);
}

BENCHMARK_CAPTURE(loadLanguage, german, "de-DE")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(loadLanguage, french, "fr-FR")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(loadLanguage, spanish, "es-ES")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(loadLanguage, japanese, "ja-JP")->Unit(benchmark::kMillisecond);
BENCHMARK(listFiles)->Unit(benchmark::kMillisecond);
BENCHMARK(lookUp)->ArgName("translated")->Arg(0)->Arg(1);
BENCHMARK(lookUpByGettext);
