// The string operations compared with ICU's UnicodeString and std::u16string in the same run. The two
// arguments are the kind of text and its length.
#include "peru/strings/CharEncodings.h"
#include "peru/strings/String.h"

#include <benchmark/benchmark.h>
#include <unicode/unistr.h>

#include <string>

using namespace peru;

namespace {

enum EText { ascii = 0, mixed = 1 };

// Eight characters of mixed text include a Latin, a Greek and a symbol character; none needs two units.
std::u16string makeText(const benchmark::State& state) {
    static const std::u16string kAscii = u"abcdefgh";
    static const std::u16string kMixed = u"abc\u00E9fg\u03B1\u20AC";
    const std::u16string& pattern = state.range(0) == ascii ? kAscii : kMixed;
    std::u16string text;
    while (text.size() < static_cast<size_t>(state.range(1))) text += pattern;
    text[text.size() - 2] = u'z';
    return text;
}

P<IString> encode(const P<ICharEncoding>& encoding, const std::u16string& text) {
    P<IString> string = CString::fromUTF16(text.data(), static_cast<int32_t>(text.size()));
    return encoding->getId() == ICharEncoding::kUTF8 ? string->toUTF8String() : string;
}

void setSpeed(benchmark::State& state) {
    state.SetItemsProcessed(state.iterations() * state.range(1));
}

template <class Prepare, class Run> void measure(benchmark::State& state, Prepare&& prepare, Run&& run) {
    auto prepared = prepare(makeText(state));
    for (auto _ : state) benchmark::DoNotOptimize(run(prepared));
    setSpeed(state);
}

struct STwo {
    P<IString> a, b;
};
STwo twoUTF16(const std::u16string& text) {
    return {encode(getUTF16CharEncoding(), text), encode(getUTF16CharEncoding(), text)};
}
STwo twoUTF8(const std::u16string& text) {
    return {encode(getUTF8CharEncoding(), text), encode(getUTF8CharEncoding(), text)};
}
STwo twoEncodings(const std::u16string& text) {
    return {encode(getUTF8CharEncoding(), text), encode(getUTF16CharEncoding(), text)};
}
using CPairOfICU = std::pair<icu::UnicodeString, icu::UnicodeString>;
CPairOfICU twoICU(const std::u16string& text) {
    return {icu::UnicodeString(text.data(), int32_t(text.size())),
            icu::UnicodeString(text.data(), int32_t(text.size()))};
}
using CPairOfStd = std::pair<std::u16string, std::u16string>;
CPairOfStd twoStd(const std::u16string& text) {
    return {text, text};
}

void BM_Compare_peru_utf16(benchmark::State& state) {
    measure(state, twoUTF16, [](STwo& s) { return s.a->compare(s.b); });
}
void BM_Compare_peru_utf8(benchmark::State& state) {
    measure(state, twoUTF8, [](STwo& s) { return s.a->compare(s.b); });
}
void BM_CompareAcross_peru(benchmark::State& state) {
    measure(state, twoEncodings, [](STwo& s) { return s.a->compare(s.b); });
}
void BM_Compare_icu(benchmark::State& state) {
    measure(state, twoICU, [](CPairOfICU& s) { return s.first.compareCodePointOrder(s.second); });
}
// ICU has no comparison across encodings: it converts first.
void BM_CompareAcross_icu(benchmark::State& state) {
    std::u16string text = makeText(state);
    std::string bytes = CString::toStdString(text.c_str());
    icu::UnicodeString other(text.data(), int32_t(text.size()));
    for (auto _ : state)
        benchmark::DoNotOptimize(icu::UnicodeString::fromUTF8(bytes).compareCodePointOrder(other));
    setSpeed(state);
}
void BM_Compare_std(benchmark::State& state) {
    measure(state, twoStd, [](CPairOfStd& s) { return s.first.compare(s.second); });
}

// Repeated calls on the same string, which caches its hash.
void BM_Hash_peru_kept(benchmark::State& state) {
    measure(state, twoUTF16, [](STwo& s) { return s.a->getHash(); });
}
// The first call on a string; the time includes its construction.
void BM_Hash_peru_first(benchmark::State& state) {
    std::u16string text = makeText(state);
    for (auto _ : state) {
        CString string(getUTF16CharEncoding(), text.data(), static_cast<int32_t>(text.size() * 2),
                       EStringStorage::refer, true, static_cast<int32_t>(text.size()));
        benchmark::DoNotOptimize(string.getHash());
    }
    setSpeed(state);
}
// ICU caches no hash and only reads 32 to 64 units of a long text.
void BM_Hash_icu(benchmark::State& state) {
    measure(state, twoICU, [](CPairOfICU& s) { return s.first.hashCode(); });
}
// Refers to the same characters without a copy, like ours.
void BM_Hash_icu_first(benchmark::State& state) {
    std::u16string text = makeText(state);
    for (auto _ : state) {
        icu::UnicodeString string(false, text.data(), static_cast<int32_t>(text.size()));
        benchmark::DoNotOptimize(string.hashCode());
    }
    setSpeed(state);
}
void BM_Hash_std(benchmark::State& state) {
    measure(state, twoStd, [](CPairOfStd& s) { return std::hash<std::u16string>()(s.first); });
}

// The match is at the end.
void BM_Find_peru_utf16(benchmark::State& state) {
    measure(state, twoUTF16, [needle = newString(u"z")](STwo& s) { return s.a->find(needle).index; });
}
void BM_Find_peru_utf8(benchmark::State& state) {
    measure(state, twoUTF8, [](STwo& s) { return s.a->find("z").index; });
}
void BM_Find_peru_literal(benchmark::State& state) {
    measure(state, twoUTF16, [](STwo& s) { return s.a->find("z").index; });
}
void BM_Find_icu(benchmark::State& state) {
    measure(state, twoICU,
            [needle = icu::UnicodeString(u"z")](CPairOfICU& s) { return s.first.indexOf(needle); });
}
void BM_Find_std(benchmark::State& state) {
    measure(state, twoStd, [needle = std::u16string(u"z")](CPairOfStd& s) { return s.first.find(needle); });
}

void BM_Concat_peru_utf16(benchmark::State& state) {
    measure(state, twoUTF16, [](STwo& s) { return s.a + s.b; });
}
void BM_Concat_peru_utf8(benchmark::State& state) {
    measure(state, twoUTF8, [](STwo& s) { return s.a + s.b; });
}
void BM_Concat_icu(benchmark::State& state) {
    measure(state, twoICU, [](CPairOfICU& s) { return s.first + s.second; });
}
void BM_Concat_std(benchmark::State& state) {
    measure(state, twoStd, [](CPairOfStd& s) { return s.first + s.second; });
}

void BM_ToUTF16_peru(benchmark::State& state) {
    measure(state, twoUTF8, [](STwo& s) { return s.a->toUTF16String(); });
}
void BM_ToUTF16_icu(benchmark::State& state) {
    std::u16string text = makeText(state);
    std::string bytes = CString::toStdString(text.c_str());
    for (auto _ : state) benchmark::DoNotOptimize(icu::UnicodeString::fromUTF8(bytes));
    setSpeed(state);
}

void everyText(benchmark::internal::Benchmark* benchmark) {
    for (int text : {ascii, mixed})
        for (int length : {16, 4096}) benchmark->Args({text, length});
}

} // namespace

BENCHMARK(BM_Compare_peru_utf16)->Apply(everyText);
BENCHMARK(BM_Compare_peru_utf8)->Apply(everyText);
BENCHMARK(BM_CompareAcross_peru)->Apply(everyText);
BENCHMARK(BM_Compare_icu)->Apply(everyText);
BENCHMARK(BM_Compare_std)->Apply(everyText);
BENCHMARK(BM_CompareAcross_icu)->Apply(everyText);
BENCHMARK(BM_Hash_peru_kept)->Apply(everyText);
BENCHMARK(BM_Hash_peru_first)->Apply(everyText);
BENCHMARK(BM_Hash_icu)->Apply(everyText);
BENCHMARK(BM_Hash_icu_first)->Apply(everyText);
BENCHMARK(BM_Hash_std)->Apply(everyText);
BENCHMARK(BM_Find_peru_utf16)->Apply(everyText);
BENCHMARK(BM_Find_peru_utf8)->Apply(everyText);
BENCHMARK(BM_Find_peru_literal)->Apply(everyText);
BENCHMARK(BM_Find_icu)->Apply(everyText);
BENCHMARK(BM_Find_std)->Apply(everyText);
BENCHMARK(BM_Concat_peru_utf16)->Apply(everyText);
BENCHMARK(BM_Concat_peru_utf8)->Apply(everyText);
BENCHMARK(BM_Concat_icu)->Apply(everyText);
BENCHMARK(BM_Concat_std)->Apply(everyText);
BENCHMARK(BM_ToUTF16_peru)->Apply(everyText);
BENCHMARK(BM_ToUTF16_icu)->Apply(everyText);
