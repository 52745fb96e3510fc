#include "Library.h"

#include <gmock/gmock.h>

#include <cstdio>
#include <fstream>
#include <set>

extern "C" int tests_readFirstExtension(char16_t* text, size_t capacity);

namespace {

using namespace tests;

std::set<std::string> runAndCollect(const std::string& command) {
    std::set<std::string> lines;
    FILE* output = popen(command.c_str(), "r");
    char line[4096];
    while (output && std::fgets(line, sizeof line, output))
        lines.insert(std::string(line, strcspn(line, "\n")));
    if (output) pclose(output);
    return lines;
}

TEST(Interface, Exports_AreTheHeadersSeventyThreeAndNothingElse) {
    const std::set<std::string> exported = runAndCollect(
        "nm -D --defined-only '" TEST_LIBRARY "' | awk '{print $3}' | grep -vE '^__(asan|tsan|ubsan|odr)'");
    const std::set<std::string> declared = runAndCollect(
        "grep -A3 '^TONEWRIGHT_API' '" TEST_HEADER "' | grep -oE 'TONEWRIGHT_[A-Za-z_]+\\(' | tr -d '('");
    EXPECT_EQ(exported.size(), 73u);
    EXPECT_EQ(exported, declared);
}

class CHost : public CLibraryTest {};

TEST_F(CHost, TextHandle_IsReadThroughTheHeader) {
    char16_t text[32];
    ASSERT_GT(tests_readFirstExtension(text, 32), 0);
    // Longer than a string's inline storage.
    CHandle handle(reinterpret_cast<TONEWRIGHT_Handle>(static_cast<peru::IInstanceWrapper*>(
        new peru::CStringInstanceWrapper(u"a text of more than a few units \U0001F3B5"))));
    EXPECT_EQ(TONEWRIGHT_GetTextLength(handle.get()), 34u);
    EXPECT_EQ(std::u16string(TONEWRIGHT_GetText(handle.get())),
              u"a text of more than a few units \U0001F3B5");
}

TEST(Interface, Features_AreNineBytes) {
    unsigned char buffer[12];
    std::fill_n(buffer, 12, uint8_t{0xEE});
    TONEWRIGHT_fillFeatures(buffer);
    const unsigned char expected[12] = {9, 0, 0, 0, 1, 1, 1, 1, 1, 0xEE, 0xEE, 0xEE};
    EXPECT_THAT(buffer, testing::ElementsAreArray(expected));
}

} // namespace
