#include "host/Program.h"

using namespace tests;

using Info = CProgramTest;

TEST_F(Info, BitRateIsThatOfTheSound) {
    write("in.wav", makeNoise(44100, 2, 16, 88200));
    peer({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "nullsrc=s=400x400,geq=random(1)*255:128:128",
          "-frames:v", "1", "noise.png"});
    for (const std::string name : {"a.mp3", "a.flac", "a.ogg", "a.wav", "a.aiff"}) {
        SCOPED_TRACE(name);
        succeed({"convert", "in.wav", "-o", name});
        const auto rate = [&] {
            return parseLines(succeed({"info", "--json", name})).at(0)["bit_rate"].get<double>();
        };
        const double before = rate();
        EXPECT_NEAR(before, 4.0 * static_cast<double>(std::filesystem::file_size(folder / name)),
                    before / 50);
        succeed({"tag", "cover", "import", name, "-i", "noise.png"});
        EXPECT_NEAR(rate(), before, before / 10); // the tag has padding
    }
}
