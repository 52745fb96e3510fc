#include "host/Program.h"

#include <gmock/gmock.h>

#include <filesystem>

using namespace tests;

namespace {

class LoadedLibraries : public CProgramTest {
protected:
    // Names of the libraries that the program loads, without their versions.
    std::set<std::string> load(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), kProgram);
        auto environment = programEnvironment();
        environment.emplace_back("LD_DEBUG", "files");
        environment.emplace_back("LD_DEBUG_OUTPUT", (folder / "loader").string());
        const SProcessResult result = run(arguments, folder.path(), environment);
        EXPECT_EQ(result.exitCode, 0) << result.err;
        std::set<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(folder.path())) {
            if (!entry.path().filename().string().starts_with("loader.")) continue;
            std::istringstream lines(readFile(entry.path()));
            bool isProgram = true; // rather than one that it started
            for (std::string line; std::getline(lines, line);) {
                if (line.find("CancelAutoplay2") != std::string::npos) isProgram = false;
                const size_t path = line.find("calling init: ");
                if (path == std::string::npos || !isProgram) continue;
                const std::string name = line.substr(line.rfind('/') + 1);
                names.insert(name.substr(0, name.find(".so")));
            }
            std::filesystem::remove(entry.path());
        }
        return names;
    }
};

// What the loader maps is most of the time that a short job takes.
TEST_F(LoadedLibraries, JobsLoadOnlyWhatTheyNeed) {
    write("in.wav", makeTone(44100, 2, 16, 0.1));
    succeed({"convert", "in.wav", "-o", "in.flac"});
    struct SCase {
        std::vector<std::string> arguments;
        size_t most;
        std::vector<const char*> loaded;
    };
    for (const SCase& job :
         {SCase{{"formats"}, 20, {}}, SCase{{"info", "in.flac"}, 26, {"libFLAC", "sonora2_flac"}},
          SCase{{"tag", "set", "--title", "x", "in.flac"}, 26, {"libtag"}},
          SCase{{"convert", "in.wav", "-o", "out.flac"}, 29, {"sonora2_wav", "libFLAC"}}}) {
        const std::set<std::string> names = load(job.arguments);
        EXPECT_THAT(names, testing::IsSupersetOf(job.loaded));
        for (const char* absent : {"libportaudio", "libswresample", "libavcodec", "libgio-2", "libglib-2",
                                   "libgtk-3", "libcdio", "libdiscio2", "libX11"})
            EXPECT_FALSE(names.contains(absent)) << absent << " for " << job.arguments[0];
#ifndef TONEWRIGHT_SANITIZED // which have libraries of their own
        EXPECT_LE(names.size(), job.most) << job.arguments[0] << ": " << testing::PrintToString(names);
#endif
    }
    EXPECT_TRUE(load({"convert", "--rate", "22050", "in.wav", "-o", "half.wav"}).contains("libswresample"));
}

} // namespace
