// Pictures of video files, compared with another program's.
#include "peru/streams/BufferedIOStream.h"
#include "peru/streams/DataStreams.h"
#include "plugins/AvFixture.h"
#include "sonora2/media/ISonoraPicture.h"
#include "sonora2/media/IVideoSource.h"

namespace tests {

namespace {

using sonora2::common::ISonoraPicture;
using sonora2::common::IVideoSource;

struct SVideoCase {
    const char* name;
    const char* options;
    int type;        // of ISonoraPicture
    const char* raw; // the peer's name of the same layout
};

const SVideoCase kVideoCases[] = {
    {"wide.mp4", "-c:v mpeg4 -g 9 -bf 2 -vf setsar=4/3", ISonoraPicture::kYV12, "yuv420p"},
    {"x.mkv", "-c:v ffv1 -pix_fmt yuv422p10le", ISonoraPicture::kRGB, "bgra"},
    {"yuy2.nut", "-c:v rawvideo -pix_fmt yuyv422", ISonoraPicture::kYUY2, "yuyv422"},
    {"nv12.nut", "-c:v rawvideo -pix_fmt nv12", ISonoraPicture::kNV12, "nv12"},
    {"full.avi", "-c:v mjpeg", ISonoraPicture::kRGB, "bgra"},
    {"odd.nut", "-c:v rawvideo -pix_fmt yuv420p -vf crop=96:63:0:0:exact=1", ISonoraPicture::kRGB, "bgra"},
    {"x.ts", "-c:v mpeg2video -g 9", ISonoraPicture::kYV12, "yuv420p"},
    {"x.webm", "-c:v libvpx -deadline realtime", ISonoraPicture::kYV12, "yuv420p"},
    {"x.wmv", "-c:v wmv2", ISonoraPicture::kYV12, "yuv420p"},
    {"x.h264", "-an -c:v libx264 -bf 0 -g 9", ISonoraPicture::kYV12, "yuv420p"},
};

class AvVideo : public CAvTest {
protected:
    static constexpr int kPictures = 40, kRate = 25;
    void encodeVideo(const std::string& options, const std::string& name) {
        run("ffmpeg -v error -y -f lavfi -i testsrc2=s=96x64:r=25:d=1.6 -f lavfi -i sine=d=1.6 " + options +
            " -c:a mp2 -ar 44100 " + name +
            " || ffmpeg -v error -y -f lavfi -i testsrc2=s=96x64:r=25:d=1.6 " + options + " " + name);
    }
    P<IVideoSource> open(const std::string& name) {
        P<IVideoSource> source = handler->createVideoSource(toURI(folder / name), nullptr);
        if (source) source->open();
        return source;
    }
    // In the order of the peer's planes.
    static std::string bytesOf(const P<ISonoraPicture>& picture) {
        std::string bytes;
        for (const int plane : {0, 2, 1}) {
            const P<peru::IMemoryBlock> block =
                picture->getImagePlane(plane, 0, 0, picture->getWidth(), picture->getHeight());
            if (!block) continue;
            size_t size = static_cast<size_t>(block->getSize());
            if (plane == 0 && picture->getPictureType() >= ISonoraPicture::kNV12) size = size * 2 / 3;
            bytes.append(reinterpret_cast<const char*>(block->getData()), size);
        }
        return bytes;
    }
    // The greatest difference between two bytes at the same place.
    static int getDistance(const std::string& a, const std::string& b) {
        if (a.size() != b.size()) return 256;
        int distance = 0;
        for (size_t i = 0; i < a.size(); ++i)
            distance = std::max(distance, std::abs(uint8_t(a[i]) - uint8_t(b[i])));
        return distance;
    }
    static std::string wireOf(const P<ISonoraPicture>& picture) {
        const auto stream = peru::make<peru::CBufferedIOStream>(peru::make<peru::CMemoryManager>());
        picture->writeTo(peru::make<peru::CDataOutStream>(stream));
        std::string bytes(static_cast<size_t>(stream->getAvailable()), '\0');
        stream->read(bytes.data(), stream->getAvailable());
        return bytes;
    }
};

TEST_F(AvVideo, Pictures_AreThoseOfAnotherProgram) {
    for (const SVideoCase& row : kVideoCases) {
        SCOPED_TRACE(row.name);
        encodeVideo(row.options, row.name);
        const P<IVideoSource> source = open(row.name);
        ASSERT_TRUE(source);
        EXPECT_EQ(96, source->getWidth());
        EXPECT_EQ(std::string(row.name).starts_with("odd") ? 63 : 64, source->getHeight());
        EXPECT_EQ(kRate, source->getFrameRateNum() / source->getFrameRateDen());
        const bool isWide = std::string(row.name).starts_with("wide");
        EXPECT_EQ(isWide ? 4 : 1, source->getPixelAspectNum());
        EXPECT_EQ(isWide ? 3 : 1, source->getPixelAspectDen());
        const bool isPlain = std::string(row.name).ends_with(".h264"); // does not state its length
        EXPECT_NEAR(isPlain ? 0.0 : 1.6, source->getDuration(), 0.15);
        std::string all;
        std::vector<std::string> pictures;
        std::vector<double> times;
        while (!source->isEOF()) {
            times.push_back(source->peekNextPictureTimestamp());
            const P<ISonoraPicture> picture = source->getNextPicture();
            ASSERT_TRUE(picture);
            EXPECT_EQ(row.type, picture->getPictureType());
            EXPECT_EQ(times.back(), picture->getTimestamp());
            const std::string untouched = wireOf(picture);
            pictures.push_back(bytesOf(picture));
            EXPECT_TRUE(untouched == wireOf(picture));
            all += pictures.back();
        }
        EXPECT_FALSE(source->getNextPicture());
        EXPECT_EQ(static_cast<size_t>(kPictures), pictures.size());
        for (size_t i = 1; i < times.size(); ++i) EXPECT_NEAR(0.04, times[i] - times[i - 1], 0.002);
        const std::string theirs =
            run("ffmpeg -v error -i " + std::string(row.name) +
                " -map 0:v -fps_mode passthrough -sws_flags bicubic+accurate_rnd -f rawvideo -pix_fmt " +
                row.raw + " -");
        EXPECT_LE(getDistance(all, theirs), row.type == ISonoraPicture::kRGB ? 1 : 0);
        const auto timeOf = [&](size_t i) {
            return times[i] - times[0] + (times[0] > 0.001 ? times[0] : 0.0);
        };
        for (const size_t i : {30u, 0u, 11u, 39u, 12u}) {
            source->skipToTime(timeOf(i));
            ASSERT_FALSE(source->isEOF()) << i;
            EXPECT_NEAR(times[i], source->peekNextPictureTimestamp(), 0.002) << i;
            EXPECT_TRUE(pictures[i] == bytesOf(source->getNextPicture())) << i;
        }
        source->close();
        source->setStartTime(timeOf(11));
        source->open();
        EXPECT_TRUE(pictures[11] == bytesOf(source->getNextPicture()));
    }
}

TEST_F(AvVideo, Preview_IsAStillOfTheTime) {
    encodeVideo("-c:v mpeg4 -g 9", "x.mp4");
    const P<IVideoSource> source = open("x.mp4");
    const double duration = source->getDuration();
    for (const double time : {-2.0, 0.0, 0.8, 1.59, duration, duration + 0.01, 100.0}) {
        int width = 0, height = 0;
        const P<ISonoraPicture> still =
            handler->createPreviewImage(toURI(folder / "x.mp4"), time, width, height);
        ASSERT_TRUE(still) << time;
        EXPECT_EQ(ISonoraPicture::kRGB, still->getPictureType());
        EXPECT_EQ(96, width);
        EXPECT_EQ(64, height);
        source->skipToTime(time > duration ? duration - 1.0 : time);
        EXPECT_EQ(bytesOf(source->getNextPicture()->getRGBPicture()), bytesOf(still)) << time;
    }
    source->close();
    source->setMaxSize(50, 50);
    source->setStartTime(0.4);
    source->open();
    EXPECT_EQ(50, source->getWidth());
    EXPECT_EQ(32, source->getHeight());
    const P<ISonoraPicture> reduced = source->getNextPicture();
    EXPECT_NEAR(0.0, reduced->getTimestamp(), 1e-6);
    const std::string theirs =
        run("ffmpeg -v error -i x.mp4 -vf 'select=eq(n\\,10),scale=50:32:flags=bicubic+accurate_rnd' "
            "-frames:v 1 -f rawvideo -pix_fmt yuv420p -");
    EXPECT_LE(getDistance(bytesOf(reduced), theirs), 1);
}

TEST_F(AvVideo, Damage_IsReportedAfterThePicturesBeforeIt) {
    run("ffmpeg -v error -f lavfi -i testsrc2=s=32x32:r=25:d=48 -c:v mjpeg x.avi");
    std::string bytes = readFile(folder / "x.avi");
    size_t at = 0; // of the start of a picture
    for (int i = 0; (at = bytes.find("\xFF\xD8\xFF", at)) != std::string::npos; ++i, ++at)
        if (i >= 5) bytes.replace(at, 600, 600, '\0');
    folder.write("x.avi", bytes);
    const P<IVideoSource> source = open("x.avi");
    ASSERT_TRUE(source);
    for (int i = 0; i < 5; ++i) {
        EXPECT_FALSE(source->isEOF());
        EXPECT_TRUE(source->getNextPicture());
    }
    EXPECT_FALSE(source->isEOF());
    EXPECT_ANY_THROW(source->getNextPicture());
    source->setStartTime(0.08);
    EXPECT_NEAR(0.0, source->peekNextPictureTimestamp(), 1e-6) << "it can be read again";
    EXPECT_NEAR(47.92, source->getDuration(), 1e-6);
    EXPECT_ANY_THROW(source->setStartTime(-0.1));
    source->close();
    EXPECT_ANY_THROW(source->getNextPicture());
    EXPECT_ANY_THROW(source->peekNextPictureTimestamp());
    EXPECT_ANY_THROW(source->skipToTime(0.0));
}

TEST_F(AvVideo, CoverOrNoPicture_IsNoVideo) {
    makeInput();
    run("ffmpeg -v error -f lavfi -i testsrc2=s=64x64 -frames:v 1 cover.png");
    encode("-i cover.png -map 0 -map 1 -c:v png -disposition:v attached_pic -c:a aac", "x.m4a");
    run("cp x.m4a x.mp4");
    EXPECT_FALSE(open("x.mp4"));
    int width = -1, height = -1;
    EXPECT_FALSE(handler->createPreviewImage(toURI(folder / "x.mp4"), 0.0, width, height));
    EXPECT_EQ(0, width + height);
    EXPECT_TRUE(openSource(folder / "x.m4a", {44100, 2, 2}));
    folder.write("x.avi", "RIFF");
    EXPECT_FALSE(open("x.avi"));
}

} // namespace

} // namespace tests
