// Reading and storing tags, compared with TagLib alone and with a plain copy. The files are made by lame,
// flac, oggenc, ffmpeg and sox in the temporary folder.
#include "filetag/FileTagFactory.h"
#include "peru/system/IPathes.h"

#include <benchmark/benchmark.h>

#include <asffile.h>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <flacfile.h>
#include <id3v2framefactory.h>
#include <id3v2tag.h>
#include <mpegfile.h>
#include <string>
#include <tfilestream.h>
#include <unistd.h>
#include <vector>
#include <vorbisfile.h>

using namespace peru;
using namespace filetag;
namespace fs = std::filesystem;

namespace {

constexpr int kFiles = 1000;
constexpr const char* kExtensions[] = {"mp3", "flac", "ogg", "wma"};

struct SFolder {
    SFolder() {
        std::string name = (fs::temp_directory_path() / "tonewright-bench-XXXXXX").string();
        if (!::mkdtemp(name.data())) std::abort();
        path = name;
    }
    ~SFolder() { fs::remove_all(path); }
    fs::path path;
};

const fs::path& getFolder() {
    static const SFolder folder;
    return folder.path;
}

void run(const std::string& command) {
    if (std::system(("cd '" + getFolder().string() + "' && " + command).c_str()) != 0) std::abort();
}

// A sound of the given length without a tag.
fs::path makeSound(const std::string& extension, int seconds) {
    const std::string name = std::to_string(seconds) + "." + extension;
    if (fs::exists(getFolder() / name)) return getFolder() / name;
    run("sox -R -n -r 44100 -b 16 -c 2 a.wav synth " + std::to_string(seconds) + " whitenoise vol 0.5");
    if (extension == "mp3") run("lame --quiet -t a.wav " + name);
    if (extension == "flac") run("flac -s -0 -P 65536 a.wav -o " + name);
    if (extension == "ogg") run("oggenc -Q a.wav -o " + name);
    if (extension == "wma") run("ffmpeg -v error -i a.wav -c:a wmav2 -map_metadata -1 " + name);
    return getFolder() / name;
}

P<IURI> toURI(const fs::path& path) {
    return getPathes()->fromPlatformPath(CString::fromUTF8(path.string()));
}

// Copies of one file with all fields filled.
const std::vector<fs::path>& getFiles(int64_t format) {
    static std::vector<fs::path> files[std::size(kExtensions)];
    std::vector<fs::path>& list = files[format];
    if (!list.empty()) return list;
    const std::string extension = kExtensions[format];
    const fs::path first = makeSound(extension, 5);
    const P<IFileTag> tag = CFileTagFactory::get()->create(toURI(first));
    tag->setTitle("A title of usual length");
    tag->setArtist("Somebody who plays");
    tag->setAlbum("The album's name");
    tag->setAlbumArtist("Somebody who plays");
    tag->setTrackNumber("7/12");
    tag->setYear("1999");
    tag->setGenre("Jazz");
    tag->setComment("Bought at a concert");
    tag->store();
    for (int i = 0; i < kFiles; ++i) {
        list.push_back(getFolder() / ("copy" + std::to_string(i) + "." + extension));
        fs::copy_file(first, list.back());
    }
    return list;
}

void BM_ReadAllFields(benchmark::State& state) {
    const std::vector<fs::path>& files = getFiles(state.range(0));
    std::vector<P<IURI>> uris;
    for (const fs::path& file : files) uris.push_back(toURI(file));
    const P<CFileTagFactory> factory = CFileTagFactory::get();
    for (auto _ : state)
        for (const P<IURI>& uri : uris) {
            const P<IFileTag> tag = factory->create(uri);
            benchmark::DoNotOptimize(tag->getTitle());
            benchmark::DoNotOptimize(tag->getArtist());
            benchmark::DoNotOptimize(tag->getAlbum());
            benchmark::DoNotOptimize(tag->getAlbumArtist());
            benchmark::DoNotOptimize(tag->getTrackNumber());
            benchmark::DoNotOptimize(tag->getYear());
            benchmark::DoNotOptimize(tag->getGenre());
            benchmark::DoNotOptimize(tag->getComment());
        }
    state.SetLabel(kExtensions[state.range(0)]);
}
BENCHMARK(BM_ReadAllFields)->DenseRange(0, 3)->Unit(benchmark::kMillisecond);

void readPlainFields(const TagLib::Tag& tag) {
    benchmark::DoNotOptimize(tag.title());
    benchmark::DoNotOptimize(tag.artist());
    benchmark::DoNotOptimize(tag.album());
    benchmark::DoNotOptimize(tag.year());
    benchmark::DoNotOptimize(tag.track());
    benchmark::DoNotOptimize(tag.genre());
    benchmark::DoNotOptimize(tag.comment());
}

void BM_TagLibAlone(benchmark::State& state) {
    const std::vector<fs::path>& files = getFiles(state.range(0));
    for (auto _ : state)
        for (const fs::path& path : files) {
            TagLib::FileStream stream(path.c_str(), true);
            switch (state.range(0)) {
            case 0: {
                TagLib::MPEG::File file(&stream, TagLib::ID3v2::FrameFactory::instance());
                readPlainFields(*file.ID3v2Tag());
                benchmark::DoNotOptimize(file.ID3v2Tag()->frameList("TPE2").front()->toString());
                break;
            }
            case 1: {
                TagLib::FLAC::File file(&stream, TagLib::ID3v2::FrameFactory::instance());
                readPlainFields(*file.xiphComment());
                benchmark::DoNotOptimize(file.xiphComment()->fieldListMap()["ALBUMARTIST"]);
                break;
            }
            case 2: {
                TagLib::Ogg::Vorbis::File file(&stream);
                readPlainFields(*file.tag());
                benchmark::DoNotOptimize(file.tag()->fieldListMap()["ALBUMARTIST"]);
                break;
            }
            default: {
                TagLib::ASF::File file(&stream);
                readPlainFields(*file.tag());
                benchmark::DoNotOptimize(file.tag()->attribute("WM/AlbumArtist"));
            }
            }
        }
    state.SetLabel(kExtensions[state.range(0)]);
}
BENCHMARK(BM_TagLibAlone)->DenseRange(0, 3)->Unit(benchmark::kMillisecond);

// A file of about 50 MB.
fs::path makeLargeFile(int64_t format) {
    constexpr int kSeconds[] = {3250, 295, 3500, 3200};
    const fs::path source = makeSound(kExtensions[format], kSeconds[format]);
    const fs::path file = getFolder() / (std::string("large.") + kExtensions[format]);
    fs::copy_file(source, file, fs::copy_options::overwrite_existing);
    return file;
}

void storeTitles(benchmark::State& state, const P<IString>& one, const P<IString>& other) {
    const fs::path file = makeLargeFile(state.range(0));
    const P<IURI> uri = toURI(file);
    int round = 0;
    for (auto _ : state) {
        const P<IFileTag> tag = CFileTagFactory::get()->create(uri);
        tag->setTitle(++round % 2 ? one : other);
        tag->store();
    }
    state.SetLabel(std::string(kExtensions[state.range(0)]) + ", " +
                   std::to_string(fs::file_size(file) / 1000000) + " MB");
}

void BM_StoreShortTitle(benchmark::State& state) {
    storeTitles(state, newString("One title"), newString("The other title"));
}
BENCHMARK(BM_StoreShortTitle)->DenseRange(0, 3)->Unit(benchmark::kMillisecond)->UseRealTime();

// The title is longer than any padding.
void BM_StoreLongTitle(benchmark::State& state) {
    storeTitles(state, CString::fromUTF8(std::string(300000, 'x')), newString("short"));
}
BENCHMARK(BM_StoreLongTitle)->Arg(1)->Unit(benchmark::kMillisecond)->UseRealTime();

void copyLargeFile(benchmark::State& state, bool synchronised) {
    const fs::path file = makeLargeFile(1);
    const fs::path copy = getFolder() / "copy";
    for (auto _ : state) {
        fs::remove(copy);
        if (std::system(("cp '" + file.string() + "' '" + copy.string() + "'").c_str()) != 0) std::abort();
        if (!synchronised) continue;
        const int descriptor = ::open(copy.c_str(), O_RDONLY);
        ::fsync(descriptor);
        ::close(descriptor);
    }
}
void BM_Copy(benchmark::State& state) {
    copyLargeFile(state, false);
}
BENCHMARK(BM_Copy)->Unit(benchmark::kMillisecond)->UseRealTime();
void BM_CopyAndSynchronise(benchmark::State& state) {
    copyLargeFile(state, true);
}
BENCHMARK(BM_CopyAndSynchronise)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_MetaflacShortTitle(benchmark::State& state) {
    const fs::path file = makeLargeFile(1);
    int round = 0;
    for (auto _ : state)
        run(std::string("metaflac --remove-tag=TITLE --set-tag='TITLE=") +
            (++round % 2 ? "One title" : "The other title") + "' " + file.filename().string());
}
BENCHMARK(BM_MetaflacShortTitle)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
