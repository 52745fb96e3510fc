// Builds language files and collects what the language manager logs.
#pragma once

#include "../chf/MemoryStream.h"
#include "peru/strings/IStringLocalizer.h"
#include "support/PeruLogLines.h"
#include "support/TempFolder.h"
#include "zvr_lang_manager/LanguageManager.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace tests {

inline std::string intBytes(uint32_t value) {
    return {reinterpret_cast<const char*>(&value), sizeof value};
}

inline std::string stringBytes(const std::u16string& text) {
    if (text.empty()) return intBytes(0);
    return intBytes(static_cast<uint32_t>(text.size() + 1)) +
           std::string(reinterpret_cast<const char*>(text.c_str()), (text.size() + 1) * sizeof(char16_t));
}

struct SText {
    std::u16string key;
    std::u16string text;
    uint32_t flags = 0;
};

// A block of texts; `filters` are further chunks in it.
inline std::string textBlock(const std::vector<SText>& texts, const std::string& filters = "") {
    std::string data = intBytes(static_cast<uint32_t>(texts.size()));
    for (const SText& each : texts)
        data += intBytes(each.flags) + stringBytes(each.key) + stringBytes(each.text) + stringBytes(u"") +
                stringBytes(u"comment");
    return chunk("STMP", chunk("data", data) + filters);
}

inline std::string languageFile(const std::u16string& language, const std::string& blocks) {
    return chunkFile(chunk("apid", stringBytes(u"id") + stringBytes(u"name")) + blocks +
                         chunk("lang", stringBytes(language) + stringBytes(u"L") + stringBytes(u"N")),
                     "URESFILE");
}

class CLanguageTest : public testing::Test {
protected:
    void SetUp() override { peru::getLogManager()->addLog(lines, peru::CString::empty()); }
    void TearDown() override {
        peru::getLogManager()->removeLog(lines, peru::CString::empty());
        peru::getStringLocalizer()->clear();
    }

    void addPack(const char* name, const CTempFolder& from) {
        manager->addPack(toURI(from.path().string() + "/"), peru::newString(name),
                         peru::newString(name) + "-");
    }
    void addPack(const char* name) { addPack(name, folder); }
    void setLanguage(const char* id) {
        manager->setCurrentLanguage(
            zvr_lang::findLanguageId(id, zvr_lang::ELanguageIdKind::languageAndCountry));
    }
    static std::string get(const char* key) { return text(peru::localize(key, "default")); }

    CTempFolder folder;
    peru::P<CPeruLogLines> lines = peru::make<CPeruLogLines>();
    peru::P<zvr_lang::CLanguageManager> manager = peru::make<zvr_lang::CLanguageManager>();
};

} // namespace tests
