#include "host/Program.h"

#include <array>
#include <cstdio>

using namespace tests;

using Formats = CProgramTest;

// What is listed as written or tagged can be.
TEST_F(Formats, AreWrittenAndTaggedAsListed) {
    const nlohmann::json listed = nlohmann::json::parse(succeed({"formats", "--json"}));
    const std::string table = succeed({"formats", "--long"});
    write("in.wav", makeTone(48000, 2, 16, 0.3));
    for (const std::string& name : listed["read"].get<std::set<std::string>>()) {
        SCOPED_TRACE(name);
        const auto has = [&](const char* list) {
            const auto names = listed[list].get<std::set<std::string>>();
            return names.count(name) > 0;
        };
        const SProcessResult result = tonewright({"convert", "in.wav", "-o", "out." + name});
        EXPECT_EQ(result.exitCode == 0, has("write")) << result.err;
        const auto mark = [&](const char* list) { return has(list) ? "yes" : "-"; };
        const nlohmann::json plugins = listed["plugins"][name];
        EXPECT_EQ(plugins.contains("write"), has("write"));
        std::array<char, 128> line;
        std::snprintf(line.data(), line.size(), "\n%-10s %-5s %-5s %-5s %-6s sonora2_", name.c_str(), "yes",
                      mark("write"), mark("tag"), plugins["boxed"].get<bool>() ? "yes" : "-");
        EXPECT_NE(table.find(line.data()), std::string::npos) << line.data() << table;
        EXPECT_NE(table.find(plugins["read"].get<std::string>()), std::string::npos);
        if (!has("write")) continue;
        EXPECT_EQ(tonewright({"tag", "set", "--title", "T", "out." + name}).exitCode == 0, has("tag"));
    }
}
