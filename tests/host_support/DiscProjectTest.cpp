// Disc projects as a host in C fills and writes them.
#include "HostSupport.h"
#include "discio2/DiscSupport.h"

using namespace tests;

namespace {

// A source that announces `frames` frames of these samples, and may have fewer or fail behind them.
struct SScript {
    std::string pcm;
    int64_t frames;
    bool fails = false;
    size_t position = 0;
    int released = 0;
};

CHandle createSource(SScript& script, int channels = 2, int width = 2) {
    TONEWRIGHT_SourceCallbacks callbacks{
        sizeof callbacks,
        [](void* user, void* samples, int64_t frames) -> int64_t {
            auto& s = *static_cast<SScript*>(user);
            const size_t size = std::min(static_cast<size_t>(frames) * 4, s.pcm.size() - s.position);
            if (size == 0 && s.fails) return -1;
            s.pcm.copy(static_cast<char*>(samples), size, s.position);
            s.position += size;
            return static_cast<int64_t>(size / 4);
        },
        [](void* user, int64_t frame) {
            static_cast<SScript*>(user)->position = static_cast<size_t>(frame) * 4;
            return 1;
        },
        [](void* user) { ++static_cast<SScript*>(user)->released; }};
    return CHandle(TONEWRIGHT_Host_CreateSourceFromCallbacks(44100, channels, width, script.frames,
                                                             &callbacks, &script));
}

class DiscProject : public CHostTest {
protected:
    int32_t write(const CHandle& project, const std::string& name) {
        return DISCIO_ProjectWriteImageW(TONEWRIGHT_Host_GetDiscProject(project),
                                         wide((folder / name).string()).c_str(), nullptr);
    }
};

std::string padded(std::string pcm) {
    pcm.resize((pcm.size() + kSectorBytes - 1) / kSectorBytes * kSectorBytes);
    return pcm;
}

} // namespace

TEST_F(DiscProject, TracksHoldTheSourcesAndSilenceUpToTheirLengths) {
    const std::string noise = makeSectors(4, 1);
    // The product of rate and duration misses some of these lengths.
    SScript scripts[] = {{noise, 4 * 588},
                         {noise.substr(0, 15 * 4), 15},
                         {noise.substr(0, 92), 23},
                         {noise.substr(4, 2000), 3 * 588}};
    CHandle project(TONEWRIGHT_Host_CreateAudioCDProject());
    ASSERT_TRUE(project);
    const int places[] = {-1, 1, 0, 3};
    for (int i = 0; i < 4; ++i)
        ASSERT_EQ(
            TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(project, createSource(scripts[i]), places[i]),
            TONEWRIGHT_OK);
    ASSERT_EQ(write(project, "a.cue"), 1) << lastError();
    const SOpenDisc disc((folder / "a.cue").string());
    const int order[] = {2, 0, 1, 3};
    for (int i = 0; i < 4; ++i) {
        std::string expected = scripts[order[i]].pcm;
        expected.resize(static_cast<size_t>(scripts[order[i]].frames) * 4);
        EXPECT_TRUE(disc.readSegment(i) == padded(expected)) << i;
    }
    for (const SScript& script : scripts) EXPECT_EQ(script.released, 0);
    project.reset();
    for (const SScript& script : scripts) EXPECT_EQ(script.released, 1);
}

TEST_F(DiscProject, TracksAreSourcesOfOtherProjects) {
    SScript script{makeSectors(200, 3), 200 * 588};
    const CHandle first(TONEWRIGHT_Host_CreateAudioCDProject()),
        second(TONEWRIGHT_Host_CreateAudioCDProject());
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(first, createSource(script), -1),
              TONEWRIGHT_OK);
    const Owned<char16_t> root(TONEWRIGHT_Host_GetDiscProjectURI(first));
    const std::u16string uri = std::u16string(root.get()) + u"Track01.cda";
    const CHandle track(TONEWRIGHT_CreateAudioSourceFromURI(uri.c_str(), 44100, 2, 2, 0));
    ASSERT_TRUE(track);
    // Opening, reading in part and closing takes the lock that reading takes.
    ASSERT_EQ(TONEWRIGHT_AudioSource_Open(track), TONEWRIGHT_OK);
    const CHandle reader(TONEWRIGHT_Host_CreateReader(track));
    std::string frames(4 * 5000, '\0');
    EXPECT_EQ(TONEWRIGHT_Host_ReadFrames(reader, frames.data(), 5000), 5000);
    EXPECT_TRUE(frames == script.pcm.substr(0, frames.size()));
    EXPECT_EQ(TONEWRIGHT_AudioSource_Close(track), TONEWRIGHT_OK);
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(second, track, -1), TONEWRIGHT_OK);
    ASSERT_EQ(write(second, "a.cue"), 1);
    EXPECT_TRUE(SOpenDisc((folder / "a.cue").string()).readSegment(0) == script.pcm);
}

TEST_F(DiscProject, ASourceThatFailsLeavesNoImage) {
    SScript script{makeSectors(5, 1), 9 * 588, true};
    const CHandle project(TONEWRIGHT_Host_CreateAudioCDProject());
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(project, createSource(script), 0),
              TONEWRIGHT_OK);
    EXPECT_EQ(write(project, "a.cue"), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_READ_INPUT);
    EXPECT_STREQ(lastFailure().message, "The host could not deliver samples");
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(DiscProject, FilesComeWithTheirFolders) {
    folder.write("a.txt", "content");
    const std::u16string file = wide("file://" + (folder / "a.txt").string());
    const std::u16string missing = wide("file://" + (folder / "b.txt").string());
    const CHandle project(TONEWRIGHT_Host_CreateDataDiscProject());
    ASSERT_TRUE(project);
    const auto add = [&](const char16_t* path, const std::u16string& source) {
        return TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(project, path, source.c_str());
    };
    EXPECT_EQ(add(u"Outer/In%C3%A4er/a b.txt", file), TONEWRIGHT_OK);
    EXPECT_EQ(add(u"/Outer/c.txt", file), TONEWRIGHT_OK);
    EXPECT_EQ(add(u"Outer/c.txt", file), TONEWRIGHT_DATA_DISC_PROJECT_FAILED);
    EXPECT_EQ(add(u"d.txt", missing), TONEWRIGHT_DATA_DISC_PROJECT_FAILED);
    EXPECT_EQ(add(nullptr, file), TONEWRIGHT_DATA_DISC_PROJECT_FAILED);
    ASSERT_EQ(write(project, "a.iso"), 1);
    const std::string list =
        run({"xorriso", "-indev", (folder / "a.iso").string(), "-find"}, folder.path()).out;
    for (const char* path : {"'./Outer/Inäer/a b.txt'", "'./Outer/c.txt'"})
        EXPECT_NE(list.find(path), std::string::npos) << list;
    EXPECT_EQ(list.find("d.txt"), std::string::npos);
}

TEST_F(DiscProject, OnlyTracksOfItsFormatAreAdded) {
    SScript script{"", 588};
    const CHandle audio(TONEWRIGHT_Host_CreateAudioCDProject()), source = createSource(script);
    const auto add = [&](TONEWRIGHT_Handle track, int32_t place) {
        return TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(audio, track, place);
    };
    EXPECT_EQ(add(nullptr, 0), 3);
    EXPECT_EQ(add(audio, 0), 3);
    EXPECT_EQ(add(source, 7), 4);
    EXPECT_EQ(add(createSource(script, 1), 0), 4);
    EXPECT_EQ(add(createSource(script, 2, 3), 0), 4);
    EXPECT_FALSE(TONEWRIGHT_Host_GetDiscProject(source));
}
