// Damaged containers, also in a plug-in that runs in a process of its own.
#include "plugins/AvFixture.h"
#include "sonora2/context/SonoraError.h"

#include <cstdlib>

namespace tests {

namespace {

class AvContainer : public CAvTest, public testing::WithParamInterface<SSoundCase> {};

// Ends in an error or in sound, and the next file is read. Cut off at 20 places and with 100 random changes
// by scripts/isolation.sh, and by a few of them otherwise.
TEST_P(AvContainer, Damage_DoesNotReachTheHost) {
    const std::string name = GetParam().name;
    makeInput(GetParam().rate, GetParam().channels);
    encode(std::string(GetParam().rate == 44100 ? "-t 0.3 " : "") + GetParam().options, name);
    const std::string bytes = readFile(folder / name);
    const std::string expected = readAll(openAv(name));
    EXPECT_LT(4'000u, expected.size());
    for (const bool isBoxed : {true, false}) {
        handler = peru::make<sonora2::common::CPluginHandler>(context, isBoxed);
        const size_t share = !isBoxed ? 3 : std::getenv("TONEWRIGHT_TEST_DAMAGE") ? 1 : 50;
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
            const size_t end =
                random() % 2 ? bytes.size() : std::min<size_t>(bytes.size(), 600); // the header
            for (int flips = 0; flips < 4; ++flips)
                damaged[random() % end] ^= static_cast<char>(1 << random() % 8);
            attempt(damaged);
        }
        folder.write(name, bytes);
        EXPECT_TRUE(expected == readAll(openAv(name)));
    }
}

INSTANTIATE_TEST_SUITE_P(Types, AvContainer, testing::ValuesIn(kSoundCases), printSound);

} // namespace

} // namespace tests
