// Damaged containers in a plug-in that runs in a process of its own.
#include "plugins/AvFixture.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/context/SonoraError.h"

#include <cstdlib>

namespace tests {

namespace {

struct SContainer {
    const char* name;
    const char* options; // for ffmpeg
};

const SContainer kContainers[] = {
    {"x.m4a", "-c:a aac"},        {"alac.m4a", "-c:a alac"},
    {"x.aac", "-c:a aac"},        {"x.opus", "-c:a libopus"},
    {"x.spx", "-c:a libspeex"},   {"x.wma", "-c:a wmav2"},
    {"x.wv", "-c:a wavpack"},     {"x.tta", "-c:a tta"},
    {"x.ac3", "-c:a ac3"},        {"x.dts", "-c:a dca -strict -2"},
    {"x.mka", "-c:a flac"},       {"x.weba", "-c:a libvorbis -f webm"},
    {"x.mp4", "-c:a aac"},        {"x.mov", "-c:a pcm_s24le"},
    {"x.avi", "-c:a libmp3lame"}, {"x.ts", "-c:a aac"},
    {"x.flv", "-c:a libmp3lame"}, {"x.mpg", "-c:a mp2"},
    {"x.nut", "-c:a pcm_f32le"},  {"x.asf", "-c:a wmav1"},
};

class AvContainer : public CAvTest, public testing::WithParamInterface<SContainer> {
protected:
    AvContainer() { handler = peru::make<sonora2::common::CPluginHandler>(context, true); }
};

// Ends in an error or in sound, and the next file is read. Cut off at 20 places and with 100 random changes
// by scripts/isolation.sh, and by a fiftieth of them otherwise.
TEST_P(AvContainer, Damage_DoesNotReachTheHost) {
    const size_t share = std::getenv("TONEWRIGHT_TEST_DAMAGE") ? 1 : 50;
    const std::string name = GetParam().name;
    makeInput();
    encode(std::string("-t 0.3 ") + GetParam().options, name);
    const std::string bytes = readFile(folder / name);
    const std::string expected = readAll(openAv(name));
    EXPECT_LT(10'000u, expected.size());
    int errors = 0;
    const auto attempt = [&](const std::string& damaged) {
        folder.write(name, damaged);
        try {
            readAll(openAv(name), 20'000'000);
        } catch (const sonora2::common::CSonoraError&) {
            ++errors;
        }
    };
    for (size_t i = 0; i < 20; i += share) attempt(bytes.substr(0, bytes.size() * i / 20));
    EXPECT_LT(0, errors) << "an empty file";
    std::mt19937 random(17);
    for (size_t i = 0; i < 100; i += share) {
        std::string damaged = bytes;
        const size_t end = random() % 2 ? bytes.size() : std::min<size_t>(bytes.size(), 600); // the header
        for (int flips = 0; flips < 4; ++flips)
            damaged[random() % end] ^= static_cast<char>(1 << random() % 8);
        attempt(damaged);
    }
    folder.write(name, bytes);
    EXPECT_TRUE(expected == readAll(openAv(name)));
}

INSTANTIATE_TEST_SUITE_P(Types, AvContainer, testing::ValuesIn(kContainers), [](const auto& row) {
    std::string name = row.param.name;
    std::ranges::replace(name, '.', '_');
    return name;
});

} // namespace

} // namespace tests
