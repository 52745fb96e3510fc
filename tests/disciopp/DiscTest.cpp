#include "discio2/DiscSupport.h"
#include "disciopp/DataFileStream.h"
#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "disciopp/IDrive.h"
#include "disciopp/ITrackStream.h"
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/streams/StreamTools.h"
#include "peru/uri/URI.h"
#include "support/Environment.h"
#include "support/Files.h"

using namespace tests;
using namespace disciopp;

namespace {

struct SDiscs : testing::Test {
    ~SDiscs() override { peru::CGlobalObjFactory::shutdown(); }

    P<IDrive> getDrive() {
        const P<IDriveManager> manager = getDriveManager();
        return manager->getDriveAt(manager->getDriveCount() - 1); // the machine may have others
    }
    std::vector<std::string> list(const P<peru::IFileObject>& object) {
        std::vector<std::string> names;
        const P<peru::IFileObjectCursor> cursor = object->enumerate();
        while (cursor->next()) names.push_back(text(cursor->getFileObject()->getName()));
        std::sort(names.begin(), names.end());
        return names;
    }

    CTempFolder folder;
    CEnvironment environment{"TONEWRIGHT_DRIVE_FOLDERS", folder.path().string()};
};

} // namespace

TEST_F(SDiscs, AudioTracksAreFiles) {
    const std::string samples = makeSectors(24, 5);
    folder.write("a.bin", samples);
    std::string sheet = "PERFORMER Band\nFILE a.bin BINARY\n";
    std::vector<std::string> names;
    for (int i = 1; i <= 12; ++i) {
        const std::string number = (i < 10 ? "0" : "") + std::to_string(i);
        sheet += "TRACK " + number + " AUDIO\nTITLE T" + number +
                 "\nINDEX 01 00:00:" + (2 * i - 2 < 10 ? "0" : "") + std::to_string(2 * i - 2) + "\n";
        names.push_back("Track" + number + ".cda");
    }
    folder.write("a.cue", sheet);
    const P<IDrive> drive = getDrive();
    const P<IDisc> disc = drive->getDisc();
    ASSERT_TRUE(disc);
    const P<IAudioCDDisc> audio = peru::tryCast<IAudioCDDisc>(disc);
    ASSERT_TRUE(audio);
    EXPECT_EQ(audio->getSegmentCount(), 12);
    EXPECT_EQ(text(audio->getText(11, DISCIO_TEXT_TITLE)), "T12");
    EXPECT_EQ(text(audio->getText(-1, DISCIO_TEXT_PERFORMER)), "Band");
    EXPECT_EQ(text(disc->getDisplayName()), "(" + folder.path().string() + ") Audio CD");
    EXPECT_EQ(list(drive->getFileSystem()->getRoot()), names);
    const P<peru::IURI> uri = drive->getPath()->appendPath("Track10.cda");
    const P<peru::IFileObject> track = drive->getFileSystem()->getFileObject(uri);
    ASSERT_TRUE(track);
    EXPECT_EQ(track->getSize(), 2 * 2352);
    EXPECT_EQ(text(track->getKind()), "application/x-cda");
    EXPECT_TRUE(track->getURI()->equals(uri));
    EXPECT_FALSE(drive->getFileSystem()->getFileObject(drive->getPath()->appendPath("Track1.cda")));
    EXPECT_THROW(track->enumerate(), peru::CFileError);
    const std::string image = "discioppdiscimage://" + (folder / "a.cue").string() + "/Track10.cda";
    for (const P<peru::IURI>& each : {uri, P<peru::IURI>(peru::make<peru::CURI>(image.c_str()))}) {
        const P<ITrackStream> stream = openTrack(each);
        const DISCIO_PCMAudioStream& pcm = stream->get();
        ASSERT_EQ(pcm.funcs->open(pcm.user), 1);
        std::string block(2 * 2352, '\0');
        int32_t delivered = 0;
        EXPECT_EQ(pcm.funcs->read(pcm.user, block.data(), 2 * 588, &delivered), 1);
        EXPECT_TRUE(block == samples.substr(18 * 2352, 2 * 2352));
    }
    for (const char* bad : {"discioppvirtualdisc:///Track01.cda", "discioppvirtualdiscaudiocd:///Track01.cda",
                            "file:///dev/null/Track01.cda", "file:///x/Track1.cda"})
        EXPECT_THROW(openTrack(peru::make<peru::CURI>(bad)), peru::CFileNotFoundError) << bad;
    // The second one names no image, and is not the drive of this test either.
    for (const char* bad : {"discioppdiscimage:///none.cue/Track01.cda", "discioppdiscimage:///Track01.cda"})
        EXPECT_THROW(openTrack(peru::make<peru::CURI>(bad)), CDISCIOPPException) << bad;
    EXPECT_THROW(openTrack(peru::make<peru::CURI>("http://x/Track01.cda")), CUnknownURIScheme);
    EXPECT_EQ(errorOf([&] { openTrack(drive->getPath()->appendPath("Track13.cda")); }),
              "The specified object does not exist. (track 13)");
}

TEST_F(SDiscs, FilesOfADataDiscAreFoundByTheirPath) {
    const CTempFolder content;
    std::filesystem::create_directories(content / "Some folder/inner");
    std::filesystem::last_write_time(
        content.write("Some folder/inner/file one", "12345"),
        std::chrono::file_clock::from_sys(std::chrono::sys_seconds(std::chrono::seconds(1'000'000'000))));
    const std::string large = makeSectors(40, 1);
    content.write("Some folder/inner/large", large);
    ASSERT_EQ(run({"genisoimage", "-quiet", "-J", "-V", "", "-o", (folder / "d.iso").string(),
                   content.path().string()})
                  .exitCode,
              0);
    const P<IDrive> drive = getDrive();
    const P<IDisc> disc = drive->getDisc();
    ASSERT_TRUE(disc);
    EXPECT_FALSE(peru::tryCast<IAudioCDDisc>(disc));
    EXPECT_EQ(text(disc->getTitle()), "[No Title]");
    const P<IFileSystem> files = drive->getFileSystem();
    EXPECT_EQ(list(files->getRoot()), std::vector<std::string>{"Some folder"});
    const P<peru::IURI> uri = drive->getPath()->appendPath("Some folder/inner/file one");
    const P<peru::IFileObject> file = files->getFileObject(uri);
    ASSERT_TRUE(file);
    EXPECT_EQ(file->getSize(), 5);
    EXPECT_TRUE(file->getAttributes().readOnly);
    EXPECT_FALSE(file->getAttributes().hidden);
    EXPECT_EQ(file->getTimes()->getLastWriteTime(), 1'000'000'000'000'000'000);
    EXPECT_EQ(text(file->getKind()) + text(files->getRoot()->getKind()),
              "application/octet-streaminode/directory");
    EXPECT_TRUE(files->getFileObject(drive->getPath()->appendPath("Some folder//inner/")));
    EXPECT_FALSE(files->getFileObject(drive->getPath()->appendPath("Some")));
    const P<peru::IURI> image = peru::make<peru::CURI>(
        ("discioppdiscimage://" + (folder / "d.iso").string() + "/Some%20folder/inner/large").c_str());
    for (const P<peru::IURI>& each : {image, drive->getPath()->appendPath("Some folder/inner/large")}) {
        const P<peru::ISeekableInStream> stream = tryOpenFile(each);
        ASSERT_TRUE(stream);
        EXPECT_TRUE(peru::readAll(*stream) == large);
        std::string part(1000, '\0');
        for (const int64_t at : {69999, 0, 40000, 32768 - 500}) {
            stream->seek(at);
            stream->read(part.data(), 1000);
            EXPECT_EQ(large.compare(static_cast<size_t>(at), 1000, part), 0) << at;
        }
        EXPECT_TRUE(stream->getURI()->equals(each));
        stream->reset();
        const P<peru::IStreamMarker> start = stream->createMarker();
        std::string all(large.size() + 1, '\0');
        EXPECT_EQ(stream->readSome(all.data(), 100), 100);
        EXPECT_EQ(stream->readSome(all.data() + 100, 40000), 32668) << "what is buffered";
        EXPECT_EQ(stream->readSome(all.data() + 32768, 32768), 32768);
        EXPECT_FALSE(stream->isAtEnd());
        EXPECT_EQ(stream->readSome(all.data() + 65536, 40000), stream->getSize() - 65536);
        EXPECT_TRUE(stream->isAtEnd());
        EXPECT_EQ(stream->readSome(all.data(), 1), 0);
        EXPECT_EQ(all, large + '\0');
        start->restore();
        stream->skip(94079);
        EXPECT_EQ(stream->getPosition(), 94079);
        EXPECT_THROW(stream->skip(2), peru::CEndOfStreamError);
        stream->skip(1);
        stream->close();
        const std::function<void()> uses[] = {
            [&] { stream->isAtEnd(); },     [&] { stream->readSome(part.data(), 1); },
            [&] { stream->skip(0); },       [&] { stream->seek(0); },
            [&] { stream->getPosition(); }, [&] { stream->getSize(); },
            [&] { stream->createMarker(); }};
        for (const auto& use : uses) EXPECT_THROW(use(), peru::CStreamClosedError);
    }
    EXPECT_FALSE(tryOpenFile(uri->appendPath("below a file")));
    EXPECT_FALSE(tryOpenFile(drive->getPath()->appendPath("Some folder")));
    EXPECT_FALSE(tryOpenFile(toURI("/elsewhere")));
    EXPECT_FALSE(files->getFileObject(uri->appendPath("below a file")));
    EXPECT_FALSE(files->getFileObject(toURI("/elsewhere")));
    EXPECT_THROW(files->deleteFile(uri), peru::CException);
    EXPECT_EQ(text(toDiscPath(uri, drive->getPath())), "Some folder\\inner\\file one");
    EXPECT_EQ(text(toDiscPath(peru::make<peru::CURI>("a/b/"), nullptr)), "a\\b");
}

TEST_F(SDiscs, WithoutAMediumEverythingIsEmpty) {
    const P<IDrive> drive = getDrive();
    EXPECT_FALSE(drive->testDisc());
    EXPECT_TRUE(list(drive->getFileSystem()->getRoot()).empty());
    EXPECT_THROW(drive->openTray(), CDISCIOPPException);
    EXPECT_THROW(drive->closeTray(), CDISCIOPPException);
    EXPECT_TRUE(drive->getReadSpeeds().empty());
    for (const int32_t index : {-1, getDriveManager()->getDriveCount()})
        EXPECT_THROW(getDriveManager()->getDriveAt(index), peru::CInvalidArgError);
    EXPECT_EQ(text(getMediumTypeText(2)), "CD-R");
    EXPECT_EQ(text(getMediumTypeText(0)), "None");
    EXPECT_EQ(text(getMediumTypeText(-1)), "Unknown");
    EXPECT_EQ(text(getMediumTypeText(14)), "BD-RE");
    EXPECT_EQ(text(getMediumTypeText(15)), "Unknown");
}
