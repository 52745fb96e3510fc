// The module of the cover editor, and the user interface toolkit with it, is loaded on first use.
#include "Library.h"
#include "support/Environment.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>

namespace {

using namespace tests;
using testing::HasSubstr;

class CoverEditor : public CLibraryTest {
protected:
    // Of the libraries that a process without windows has no use for.
    static std::string findMapped() {
        std::ifstream maps("/proc/self/maps");
        std::string found;
        for (std::string line; std::getline(maps, line);)
            for (const char* name : {"covereditor", "/libwx", "/libgtk", "/libgdk", "/libcairo", "/libpango"})
                if (line.find(name) != std::string::npos) found += line.substr(line.rfind('/')) + " ";
        return found;
    }
    // The log's last line of a call that fails.
    std::string fail() const {
        EXPECT_EQ(TONEWRIGHT_CreateCoverEditorHandle(0, u"/x", nullptr), 0u);
        const std::vector<SLine> lines = log->take();
        return lines.empty() ? "" : lines.back().text;
    }
};

TEST_F(CoverEditor, IsLoadedByTheFirstEditorOnly) {
    TONEWRIGHT_ReleaseCoverEditorHandle(0);
    EXPECT_FALSE(TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoNextPage());
    log->take();
    for (int i = 0; i < 3; ++i) TONEWRIGHT_EMBEDDEDCOVEREDITOR_Idle();
    EXPECT_LE(log->take().size(), 1u) << "a host's idle time must not fill the log";
    EXPECT_EQ(findMapped(), "");

    const CTempFolder broken, other;
    broken.write("tonewright_covereditor.so", "no library");
    std::filesystem::create_symlink(TEST_PLUGIN, other / "tonewright_covereditor.so");
    for (const CTempFolder* each : {&broken, &other}) {
        const CEnvironment environment("TONEWRIGHT_LIBRARY_PATH", each->path());
        EXPECT_THAT(fail(), HasSubstr((*each / "tonewright_covereditor.so").string()));
    }
    EXPECT_EQ(findMapped(), "");

    EXPECT_THAT(fail(), HasSubstr("not available in this build"));
    EXPECT_THAT(findMapped(), HasSubstr("tonewright_covereditor.so"));
}

} // namespace
