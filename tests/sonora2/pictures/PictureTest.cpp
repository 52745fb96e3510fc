#include "peru/remote/RemoteException.h"
#include "sonora2/ScriptedMedia.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/pictures/NV12Picture.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/pictures/SonoraPictureRemote.h"
#include "sonora2/pictures/YUY2Picture.h"
#include "sonora2/pictures/YV12Picture.h"

#include <algorithm>
#include <gmock/gmock.h>
#include <random>

namespace {

using namespace sonora2::common;
using peru::make;
using Bytes = std::string;

const P<peru::CMemoryManager> kMemory = make<peru::CMemoryManager>();

P<peru::IMemoryBlock> makeBlock(const Bytes& bytes) {
    P<peru::IMemoryBlock> block = kMemory->getBlock(static_cast<int64_t>(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), block->getData());
    return block;
}

Bytes bytesOf(const P<peru::IMemoryBlock>& block) {
    return {reinterpret_cast<const char*>(block->getData()), static_cast<size_t>(block->getSize())};
}

template <class T> P<T> makePicture(int width, int height, Bytes bytes = {}, bool flipped = false) {
    std::minstd_rand random(static_cast<unsigned>(width * height));
    const auto size = static_cast<size_t>(T::getBlockBytes(width, height));
    while (bytes.size() < size) bytes.push_back(static_cast<char>(random() >> 8));
    return make<T>(kMemory, 1.5, width, height, flipped, makeBlock(bytes));
}

Bytes planeOf(const P<ISonoraPicture>& picture, int plane) {
    return bytesOf(picture->getImagePlane(plane, 0, 0, picture->getWidth(), picture->getHeight()));
}

uint32_t makePixel(int byte0, int byte1, int byte2) {
    const auto clamp = [](int value) { return static_cast<uint32_t>(std::min(std::max(value, 0), 255)); };
    return 0xFF000000u + (clamp(byte2) << 16) + (clamp(byte1) << 8) + clamp(byte0);
}

uint32_t makePlanarPixel(int luma, int u, int v) {
    const int c = (luma - 16) * 9535;
    return makePixel((c + 16531 * (u - 128)) >> 13, (c - 3203 * u - 6660 * v + 1262464) >> 13,
                     (c + 13074 * (v - 128)) >> 13);
}

// Every combination of luma and chroma, four values of luma at a time for one of chroma.
TEST(Picture, Conversions_EqualTheirFormulas) {
#ifdef TONEWRIGHT_SANITIZED
    const int step = 5;
#else
    const int step = 1;
#endif
    constexpr int kWidth = 512, kHeight = 128; // 64 rows of 256 pairs: every v and a quarter of the luma
    Bytes nv12(CNV12Picture::getBlockBytes(kWidth, kHeight), '\0'), yv12 = nv12;
    Bytes yuy2(CYUY2Picture::getBlockBytes(kWidth, kHeight), '\0');
    size_t failures = 0;
    for (int u = 0; u<256; u = u + step> 255 && u < 255 ? 255 : u + step) {
        const auto lumaAt = [](int x, int y) { return static_cast<uint8_t>(y / 2 * 4 + y % 2 * 2 + x % 2); };
        for (int y = 0; y < kHeight; ++y) {
            for (int x = 0; x < kWidth; ++x) {
                const size_t at = static_cast<size_t>(y * kWidth + x);
                nv12[at] = yv12[at] = yuy2[2 * at] = static_cast<char>(lumaAt(x, y));
                yuy2[2 * at + 1] = static_cast<char>(x % 2 == 0 ? u : x / 2);
                const size_t pair = static_cast<size_t>(y / 2 * (kWidth / 2) + x / 2);
                nv12[kWidth * kHeight + 2 * pair] = static_cast<char>(u);
                nv12[kWidth * kHeight + 2 * pair + 1] = static_cast<char>(x / 2);
                yv12[kWidth * kHeight + pair] = static_cast<char>(x / 2);
                yv12[kWidth * kHeight * 5 / 4 + pair] = static_cast<char>(u);
            }
        }
        const auto convert = [](const auto& picture) { return planeOf(picture->getRGBPicture(), 0); };
        const Bytes planar = convert(makePicture<CNV12Picture>(kWidth, kHeight, nv12));
        const Bytes packed = convert(makePicture<CYUY2Picture>(kWidth, kHeight, yuy2));
        ASSERT_TRUE(planar == convert(makePicture<CYV12Picture>(kWidth, kHeight, yv12)));
        for (int i = 0; i < kWidth * kHeight; ++i) {
            const int luma = lumaAt(i % kWidth, i / kWidth), v = i % kWidth / 2;
            const int p = (luma - 16) * 298, d = u - 128, e = v - 128;
            const uint32_t expected[] = {makePlanarPixel(luma, u, v),
                                         makePixel((p + 409 * d + 128) >> 8,
                                                   (p - 208 * d - 100 * e + 128) >> 8,
                                                   (p + 516 * e + 128) >> 8)};
            failures += std::memcmp(&expected[0], &planar[4 * static_cast<size_t>(i)], 4) != 0;
            failures += std::memcmp(&expected[1], &packed[4 * static_cast<size_t>(i)], 4) != 0;
        }
    }
    EXPECT_EQ(0u, failures);
    // Pixels at an odd border take the chroma beside them; a picture that is too small for chroma is grey.
    for (const auto& [width, height] : {std::pair{2, 2}, {2, 3}, {3, 2}, {5, 5}, {1, 4}, {4, 1}, {1, 1}}) {
        const Bytes bytes =
            tests::patternBytes(static_cast<size_t>(CNV12Picture::getBlockBytes(width, height)));
        const Bytes rgb = planeOf(makePicture<CNV12Picture>(width, height, bytes)->getRGBPicture(), 0);
        for (int i = 0; i < width * height; ++i) {
            const int x = std::min(i % width / 2, width / 2 - 1), y = std::min(i / width / 2, height / 2 - 1);
            const size_t pair = static_cast<size_t>(width * height + 2 * (y * (width / 2) + x));
            const bool isGrey = x < 0 || y < 0;
            const int u = isGrey ? 128 : uint8_t(bytes[pair]), v = isGrey ? 128 : uint8_t(bytes[pair + 1]);
            const uint32_t expected = makePlanarPixel(uint8_t(bytes[static_cast<size_t>(i)]), u, v);
            EXPECT_EQ(0, std::memcmp(&expected, &rgb[4 * static_cast<size_t>(i)], 4))
                << width << "x" << height;
        }
    }
    // A last pixel without a partner has no v of its own.
    Bytes odd(CYUY2Picture::getBlockBytes(3, 1), '\0');
    odd.replace(0, 6, "\x52\x10\x90\xF0\x28\x50");
    const int p = (0x28 - 16) * 298, d = 0x50 - 128;
    const uint32_t last = makePixel((p + 409 * d + 128) >> 8, (p - 208 * d + 128) >> 8, (p + 128) >> 8);
    const Bytes converted = planeOf(makePicture<CYUY2Picture>(3, 1, odd)->getRGBPicture(), 0);
    EXPECT_EQ(converted.substr(8), Bytes(reinterpret_cast<const char*>(&last), 4));
}

TEST(Picture, RGBForm_IsMadeOnceAndAgainAfterAChange) {
    const auto picture = makePicture<CYV12Picture>(6, 4);
    const P<ISonoraPicture> rgb = picture->getRGBPicture();
    EXPECT_TRUE(rgb == picture->getRGBPicture());
    EXPECT_TRUE(rgb == rgb->getRGBPicture());
    for (int plane = 0; plane < 3; ++plane) picture->fillPlaneBlack(plane, 0, 0, 6, 4);
    EXPECT_EQ(Bytes(24, 16) + Bytes(12, '\x80'), planeOf(picture, 0));
    std::string black;
    for (int i = 0; i < 24; ++i) black += Bytes("\0\0\0\xFF", 4);
    EXPECT_EQ(black, bytesOf(picture->getRGBBlock(0, 0, 6, 4)));
}

TEST(Picture, Planes_AreSharedAsAWholeAndCopiedInParts) {
    Bytes counted(36, '\0');
    for (size_t i = 0; i < counted.size(); ++i) counted[i] = static_cast<char>(i);
    const P<ISonoraPicture> yv12 = makePicture<CYV12Picture>(6, 4, counted);
    const P<ISonoraPicture> nv12 = makePicture<CNV12Picture>(6, 4, counted);
    EXPECT_EQ(counted.substr(24, 6), planeOf(yv12, 1));
    EXPECT_EQ(counted.substr(30, 6), planeOf(yv12, 2));
    EXPECT_EQ(counted.substr(24, 12), planeOf(nv12, 1));
    EXPECT_EQ("\x8\x9\xE\xF", bytesOf(yv12->getImagePlane(0, 2, 1, 2, 2)));
    EXPECT_EQ("\x1F\x20", bytesOf(yv12->getImagePlane(2, 2, 0, 4, 2)));
    EXPECT_EQ("\x20\x21\x22\x23", bytesOf(nv12->getImagePlane(1, 2, 2, 4, 2)));
    const P<peru::IMemoryBlock> view = yv12->getImagePlane(2, 0, 0, 6, 4);
    EXPECT_EQ(Bytes("\6\0\0\0", 4) + counted.substr(30, 6), tests::serialise(view));
    tests::deserialise(view, Bytes("\2\0\0\0xy", 6));
    EXPECT_EQ("xy", bytesOf(view));
    EXPECT_EQ("xy\x20", planeOf(yv12, 0).substr(30, 3));
    for (const int size : {-1, 7}) EXPECT_THROW(view->setSize(size), peru::CInvalidArgError);
    view->setSize(6);
    EXPECT_EQ("xy\x20\x21\x22\x23", bytesOf(view));

    const P<ISonoraPicture> rgb = makePicture<CRGBPicture>(5, 3), yuy2 = makePicture<CYUY2Picture>(6, 2);
    EXPECT_TRUE(rgb->getImagePlane(0, 1, 1, 3, 1));
    const std::pair<P<ISonoraPicture>, int> counts[] = {{rgb, 1}, {yuy2, 1}, {nv12, 2}, {yv12, 3}};
    const char* const names[] = {"CYUY2Picture", "CNV12Picture", "CYV12Picture"};
    const char* const shaders[] = {"", "yuy2rgbMain", "nv12rgbMain", "yv12rgbMain"};
    for (const auto& [picture, count] : counts) {
        EXPECT_EQ(shaders[picture->getPictureType() - 1],
                  peru::CString::toStdString(picture->getPixelShaderName()));
        EXPECT_FALSE(picture->getImagePlane(count, 0, 0, 2, 2));
        EXPECT_FALSE(picture->getImagePlane(-1, 0, 0, 2, 2));
        EXPECT_THROW(picture->getImagePlane(0, 4, 0, 4, 2), peru::CInvalidArgError);
        if (picture == rgb) continue;
        try {
            picture->getImagePlane(0, 0, 0, 5, 2);
            FAIL();
        } catch (const CSonoraError& error) {
            EXPECT_EQ(std::string(names[picture->getPictureType() - 2]) +
                          "::getImagePlane nWidth must be a pow of 2!",
                      peru::CString::toStdString(error.getDescription()));
        }
    }
}

TEST(Picture, DrawInto_CopiesARectangleOfEveryPlane) {
    const auto from = makePicture<CNV12Picture>(8, 6);
    const auto to = makePicture<CNV12Picture>(10, 8);
    from->drawInto(to, 4, 2, 2, 2, 6, 4);
    for (int plane = 0; plane < 2; ++plane)
        EXPECT_EQ(bytesOf(from->getImagePlane(plane, 2, 2, 6, 4)),
                  bytesOf(to->getImagePlane(plane, 4, 2, 6, 4)));
    EXPECT_THROW(from->drawInto(makePicture<CYV12Picture>(8, 6), 0, 0, 0, 0, 2, 2), peru::CInvalidArgError);
    EXPECT_THROW(from->drawInto(to, 6, 0, 0, 0, 6, 4), peru::CInvalidArgError);

    // Into itself, down and up, as if it were another one.
    for (const int shift : {0, 2}) {
        const auto same = makePicture<CYV12Picture>(8, 8), copy = makePicture<CYV12Picture>(8, 8);
        const auto source = makePicture<CYV12Picture>(8, 8);
        EXPECT_TRUE(same->getRGBPicture());
        same->drawInto(same, shift, shift, 2 - shift, 2 - shift, 6, 6);
        source->drawInto(copy, shift, shift, 2 - shift, 2 - shift, 6, 6);
        for (int plane = 0; plane < 3; ++plane) EXPECT_EQ(planeOf(copy, plane), planeOf(same, plane));
        EXPECT_EQ(planeOf(copy->getRGBPicture(), 0), planeOf(same->getRGBPicture(), 0));
    }
}

TEST(Picture, FlippedPicture_IsCopiedInDisplayOrder) {
    const auto picture = makePicture<CRGBPicture>(2, 3, "aaaabbbbccccddddeeeeffff", true);
    Bytes copy(20, '.');
    picture->copyRGBRect(reinterpret_cast<uint8_t*>(copy.data()), 10, 1, 1, 1, 2);
    EXPECT_EQ("dddd......bbbb......", copy);
}

TEST(Picture, Thumbnail_TakesEveryFourthPixel) {
    const auto yuy2 = makePicture<CYUY2Picture>(40, 9);
    const P<ISonoraPicture> small = yuy2->createThumbnail();
    EXPECT_EQ(8, small->getWidth());
    EXPECT_EQ(2, small->getHeight());
    const Bytes all = planeOf(yuy2, 0), reduced = planeOf(small, 0);
    for (size_t x = 0; x < 8; ++x) {
        EXPECT_EQ(all[(4 * 40 + 4 * x) * 2], reduced[(8 + x) * 2]) << x;
        EXPECT_EQ(all[(4 * 40 + x / 2 * 8) * 2 + x % 2 * 2 + 1], reduced[(8 + x) * 2 + 1]) << x;
    }
    const P<ISonoraPicture> pictures[] = {makePicture<CRGBPicture>(16, 24), makePicture<CNV12Picture>(16, 24),
                                          makePicture<CYV12Picture>(16, 24)};
    for (const P<ISonoraPicture>& picture : pictures)
        for (int plane = 0; picture->getImagePlane(plane, 0, 0, 2, 2); ++plane) {
            const Bytes whole = planeOf(picture, plane), quarter = planeOf(picture->createThumbnail(), plane);
            const size_t columns = plane ? 2 : 4, unit = whole.size() / (columns * 4 * columns * 6);
            Bytes expected;
            for (size_t i = 0; i < columns * (plane ? 3 : 6); ++i)
                expected += whole.substr((i / columns * columns * 4 + i % columns) * 4 * unit, unit);
            EXPECT_EQ(expected, quarter.substr(0, expected.size()))
                << picture->getPictureType() << " " << plane;
        }
    EXPECT_EQ(0, makePicture<CNV12Picture>(3, 3)->createThumbnail()->getWidth());
}

TEST(PictureRemote, CarriesEveryLayout) {
    const P<ISonoraPicture> pictures[] = {makePicture<CRGBPicture>(3, 5),
                                          makePicture<CYUY2Picture>(4, 3, {}, true),
                                          makePicture<CNV12Picture>(6, 4), makePicture<CYV12Picture>(0, 0)};
    for (const P<ISonoraPicture>& picture : pictures) {
        const std::string form = tests::serialise(make<CSonoraPictureRemote>(kMemory, picture));
        EXPECT_EQ(picture->getPictureType(), form[0]);
        EXPECT_EQ(Bytes("\0\0\0\0\0\0\0\xF8\x3F", 9), form.substr(3, 9));
        const auto copy = make<CSonoraPictureRemote>(kMemory);
        tests::deserialise(copy, form);
        EXPECT_EQ(form, tests::serialise(copy));
        EXPECT_EQ(0, copy->getPictureType());
        EXPECT_EQ(picture->isFlipped(), copy->getPicture()->isFlipped());
        EXPECT_THROW(tests::deserialise(copy, Bytes("\5\0\0\0", 4)), peru::CRemoteException);
        EXPECT_FALSE(copy->getPicture());
    }
    const auto nothing = make<CSonoraPictureRemote>(kMemory);
    EXPECT_EQ(Bytes(4, '\0'), tests::serialise(nothing));
    EXPECT_EQ(0u, nothing->getPixelShaderName()->getDataSize());
    const P<ISonoraPicture> bare = make<CRGBPicture>(kMemory, 0.0, 1, 1);
    EXPECT_EQ(Bytes(4, '\0'), tests::serialise(bare).substr(17));
    EXPECT_THROW(bare->getRGBBlock(0, 0, 1, 1), CSonoraError);
    // The size of the block is not part of the form; a use of the missing pixels is an error.
    std::string form = tests::serialise(make<CSonoraPictureRemote>(kMemory, pictures[2]));
    form[12] = 100;
    const auto copy = make<CSonoraPictureRemote>(kMemory);
    tests::deserialise(copy, form);
    EXPECT_EQ(100, copy->getPicture()->getWidth());
    EXPECT_THROW(copy->getPicture()->getRGBPicture(), CSonoraError);
}

} // namespace
