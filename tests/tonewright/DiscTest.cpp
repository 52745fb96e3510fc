// Tracks as a host uses them, with a folder of images as the drive.
#include "Library.h"
#include "discio2/DiscSupport.h"
#include "support/Environment.h"

using namespace tests;

TEST(Disc, TracksAreSources) {
    const CTempFolder folder;
    const CEnvironment environment("TONEWRIGHT_DRIVE_FOLDERS", folder.path().string());
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
    TONEWRIGHT_InitDiscio(0);
    folder.write("a.bin", makeSectors(150, 1));
    folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n");
    for (const std::string& place :
         {"file://" + folder.path().string(), "discioppdiscimage://" + (folder / "a.cue").string()}) {
        const std::u16string uri = wide(place + "/Track01.cda");
        const CHandle source(TONEWRIGHT_CreateAudioSourceFromURI(uri.c_str(), 44100, 2, 2, 0));
        ASSERT_TRUE(source) << place;
        EXPECT_EQ(TONEWRIGHT_AudioSource_GetDuration(source.get()), 2.0);
        const std::u16string other = wide(place + "/Track02.cda");
        EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSourceFromURI(other.c_str(), 44100, 2, 2, 0)));
    }
    TONEWRIGHT_DeInitAll();
}
