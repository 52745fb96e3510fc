// Disc projects as a host in C fills and writes them.
#include "discio2/DiscSupport.h"
#include "support/Files.h"

#include <tonewright/host.h>

using namespace tests;

namespace {

struct SHandleEnd {
    void operator()(TONEWRIGHT_HandleData* handle) const { TONEWRIGHT_Host_DestroyHandle(handle); }
};
using CHandle = std::unique_ptr<TONEWRIGHT_HandleData, SHandleEnd>;

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

class DiscProject : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }
    int32_t write(const CHandle& project, const std::string& name) {
        return DISCIO_ProjectWriteImageW(TONEWRIGHT_Host_GetDiscProject(project.get()),
                                         wide((folder / name).string()).c_str(), nullptr);
    }

    CTempFolder folder;
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
        ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(
                      project.get(), createSource(scripts[i]).get(), places[i]),
                  TONEWRIGHT_OK);
    ASSERT_EQ(write(project, "a.cue"), 1) << SOpenDisc("").getError();
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
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(first.get(), createSource(script).get(), -1),
              TONEWRIGHT_OK);
    char16_t* const root = TONEWRIGHT_Host_GetDiscProjectURI(first.get());
    const std::u16string uri = std::u16string(root) + u"Track01.cda";
    TONEWRIGHT_Host_Free(root);
    const CHandle track(TONEWRIGHT_CreateAudioSourceFromURI(uri.c_str(), 44100, 2, 2, 0));
    ASSERT_TRUE(track);
    // Opening, reading in part and closing takes the lock that reading takes.
    ASSERT_EQ(TONEWRIGHT_AudioSource_Open(track.get()), TONEWRIGHT_OK);
    const CHandle reader(TONEWRIGHT_Host_CreateReader(track.get()));
    std::string frames(4 * 5000, '\0');
    EXPECT_EQ(TONEWRIGHT_Host_ReadFrames(reader.get(), frames.data(), 5000), 5000);
    EXPECT_TRUE(frames == script.pcm.substr(0, frames.size()));
    EXPECT_EQ(TONEWRIGHT_AudioSource_Close(track.get()), TONEWRIGHT_OK);
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(second.get(), track.get(), -1),
              TONEWRIGHT_OK);
    ASSERT_EQ(write(second, "a.cue"), 1);
    EXPECT_TRUE(SOpenDisc((folder / "a.cue").string()).readSegment(0) == script.pcm);
}

TEST_F(DiscProject, ASourceThatFailsLeavesNoImage) {
    SScript script{makeSectors(5, 1), 9 * 588, true};
    const CHandle project(TONEWRIGHT_Host_CreateAudioCDProject());
    ASSERT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(project.get(), createSource(script).get(), 0),
              TONEWRIGHT_OK);
    EXPECT_EQ(write(project, "a.cue"), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_READ_INPUT);
    TONEWRIGHT_Failure failure = {};
    failure.size = sizeof failure;
    EXPECT_EQ(TONEWRIGHT_Host_GetLastFailure(&failure), 1);
    EXPECT_STREQ(failure.message, "The host could not deliver samples");
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(DiscProject, FilesComeWithTheirFolders) {
    folder.write("a.txt", "content");
    const std::u16string file = wide("file://" + (folder / "a.txt").string());
    const std::u16string missing = wide("file://" + (folder / "b.txt").string());
    const CHandle project(TONEWRIGHT_Host_CreateDataDiscProject());
    ASSERT_TRUE(project);
    const auto add = [&](const char16_t* path, const std::u16string& source) {
        return TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(project.get(), path, source.c_str());
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

TEST_F(DiscProject, WrongHandlesHaveTheirCodes) {
    SScript script{"", 588};
    const CHandle source = createSource(script), mono = createSource(script, 1),
                  deep = createSource(script, 2, 3);
    const CHandle audio(TONEWRIGHT_Host_CreateAudioCDProject()),
        data(TONEWRIGHT_Host_CreateDataDiscProject());
    const struct {
        TONEWRIGHT_Handle project, source;
        int32_t place, code;
    } cases[] = {{audio.get(), nullptr, 0, 3},      {audio.get(), audio.get(), 0, 3},
                 {nullptr, source.get(), 0, 4},     {data.get(), source.get(), 0, 4},
                 {audio.get(), source.get(), 7, 4}, {audio.get(), mono.get(), 0, 4},
                 {audio.get(), deep.get(), 0, 4},   {nullptr, nullptr, 0, 4}};
    for (const auto& c : cases)
        EXPECT_EQ(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(c.project, c.source, c.place), c.code);
    EXPECT_EQ(TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(audio.get(), u"a", u"file:///etc/passwd"), 7);
    EXPECT_FALSE(TONEWRIGHT_Host_GetDiscProject(source.get()));
    EXPECT_TRUE(TONEWRIGHT_Host_GetDiscProject(data.get()));
}
