#include "host/Program.h"
#include "support/Environment.h"

using namespace tests;

namespace {

class Ranges : public CProgramTest {
    // No sound devices: the plug-ins of the system's configuration may leak.
    const CEnvironment m_alsa{"ALSA_CONFIG_PATH", "/dev/null"};
};

} // namespace

// An accepted value leads to the failure that the input does not exist, or that there is no sound device.
TEST_F(Ranges, EndWhereTheirMessageSays) {
    const std::string convert = "convert none.wav -o x.flac", waveform = "waveform none.wav -o x.png";
    const struct {
        std::string command;
        const char *option, *lowest, *highest, *below, *above;
    } cases[] = {
        {convert, "--rate", "1", "768000", "0", "768001"},
        {convert, "--channels", "1", "32", "0", "33"},
        {"convert none.wav -o x.ogg", "--quality", "0", "1", "-0.01", "1.01"},
        {convert, "--jobs", "1", "256", "0", "257"},
        {"rip none.cue", "--jobs", "1", "256", "0", "257"},
        {"burn none.wav --drive /none", "--speed", "1", "1000", "0.9", "1000.1"},
        {"burn none.wav --image x.cue", "--gap", "0", "300", "-0.1", "300.1"},
        {"cddb none.cue --server x", "--timeout", "0.001", "1000000", "0.0009", "1000000.1"},
        {"play none.wav", "--volume", "0", "130", "-1", "131"},
        {"record -o none/x.wav", "--seconds", "0.001", "1000000000", "0.0009", "1000000000.1"},
        {waveform, "--width", "16", "32767", "15", "32768"},
        {waveform, "--height", "16", "32767", "15", "32768"},
    };
    for (const auto& each : cases) {
        const auto run = [&](const std::string& value) {
            return tonewright(with(words(each.command), {each.option + ("=" + value)}));
        };
        for (const char* value : {each.lowest, each.highest}) {
            const SProcessResult result = run(value);
            EXPECT_TRUE(result.exitCode == 1 || result.exitCode == 3) << each.option << value << result.err;
        }
        for (const char* value : {each.below, each.above}) {
            const SProcessResult result = run(value);
            EXPECT_EQ(result.exitCode, 2);
            EXPECT_EQ(result.err.substr(0, result.err.find('\n')), std::string(each.option) + ": the value " +
                                                                       value + " is not in the range " +
                                                                       each.lowest + " to " + each.highest);
        }
    }
}
