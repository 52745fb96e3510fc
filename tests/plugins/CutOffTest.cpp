// The state of a file on disk while it is being written.
#include "plugins/PluginFixture.h"

#include <chrono>
#include <thread>

namespace tests {

namespace {

class CutOff : public CPluginTest {};

} // namespace

TEST_F(CutOff, LeavesAFileThatPlaysUpToItsLastHalfSecond) {
    const SShape shape;
    constexpr size_t kFrames = 3 * 44100;
    const std::string pcm = makeMusic(shape, kFrames);
    std::vector<P<IAudioFormat>> formats;
    std::vector<std::filesystem::path> files;
    for (const SFormatCase& row : kFormatCases) {
        files.push_back(folder / ("x." + std::string(row.extension)));
        formats.push_back(makeFormat(files.back(), shape));
        ASSERT_TRUE(formats.back());
        formats.back()->open();
    }
    // Sound arrives as slowly as in a recording. Codecs may still hold back some of it.
    std::this_thread::sleep_for(std::chrono::milliseconds(550));
    for (const P<IAudioFormat>& format : formats) format->writeAudioChunk(makeChunk(pcm));

    for (size_t i = 0; i < files.size(); ++i) {
        const SFormatCase& row = kFormatCases[i];
        SCOPED_TRACE(row.extension);
        // sox relies on the sizes in the header, unlike other programs.
        const bool isContainer = std::string(row.plugin) == "sonora2_wav";
        const std::string played =
            run(isContainer ? "sox -t sndfile '" + files[i].string() + "' -t raw -"
                            : "ffmpeg -v fatal -i '" + files[i].string() + "' -f s16le -c:a pcm_s16le -");
        EXPECT_GT(played.size(), pcm.size() - pcm.size() / 6);
        EXPECT_TRUE(!row.lossless || pcm.starts_with(played));
        // Writing continues normally.
        formats[i]->writeAudioChunk(makeChunk(pcm));
        formats[i]->close();
        const std::string whole = readAll(openSource(files[i], shape));
        EXPECT_GE(whole.size(), 2 * pcm.size());
        EXPECT_TRUE(!row.lossless || whole == pcm + pcm);
    }
}

} // namespace tests
