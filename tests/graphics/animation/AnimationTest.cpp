#include "graphics/animation/IAnimation.h"

#include "graphics/ImageTool.h"
#include "graphics/images/WxImages.h"
#include "peru/Errors.h"
#include "peru/gui/ImageConversion.h"
#include "wxjng/Mng.h"

#include <wx/image.h>

using namespace graphics::animation;
using peru::gui::CRGBAImage;

namespace {

constexpr const char* kScene =
    "-size 60x40 xc:red -set delay 10 -set dispose none ( -size 20x15 xc:blue -repage 60x40+30+10 -set delay "
    "25 -set "
    "dispose background ) ( -size 25x25 pattern:circles -transparent white -repage 60x40+2+8 -set delay 7 "
    "-set "
    "dispose previous ) ( -size 30x12 xc:yellow -repage 60x40+40+33 -set delay 50 -set dispose none ) ";

std::string makeScene(const tests::CTempFolder& folder, const std::string& options, const std::string& name) {
    tests::runImageTool(folder.path(), kScene + options + " " + name);
    return tests::readFile(folder.path() / name);
}

// All frames one after the other, as the other program writes them.
std::vector<uint32_t> getFrames(IAnimation& animation) {
    std::vector<uint32_t> pixels;
    for (int i = 0; i < animation.GetFrameCount(); ++i) {
        const CRGBAImage frame = animation.GetFrame(i);
        pixels.insert(pixels.end(), frame.getPixels().begin(), frame.getPixels().end());
    }
    return pixels;
}

std::vector<int> getDurations(IAnimation& animation) {
    std::vector<int> durations;
    for (int i = 0; i < animation.GetFrameCount(); ++i) durations.push_back(animation.GetDuration(i));
    return durations;
}

std::string makeMng(const std::vector<int>& durations, int loops) {
    std::vector<wxImage> images;
    std::vector<wxjng::SMngFrame> frames;
    for (size_t i = 0; i < durations.size(); ++i) {
        images.emplace_back(20, 10);
        images.back().SetRGB(wxRect(0, 0, 20, 10), static_cast<uint8_t>(40 * i), 7, 99);
    }
    for (size_t i = 0; i < durations.size(); ++i) frames.push_back({images[i], durations[i]});
    return wxjng::encodeMng(frames, loops);
}

} // namespace

TEST(Animation, ComposesGifLikeThePeer) {
    const tests::CTempFolder folder;
    for (const char* const options : {"-loop 3", "-loop 0 -interlace GIF", "-layers optimize"}) {
        const auto animation = OpenAnimation(makeScene(folder, options, "a.gif"));
        ASSERT_EQ(animation->GetFrameCount(), 4);
        EXPECT_EQ(
            tests::compare(getFrames(*animation), tests::readByImageTool(folder.path(), "a.gif -coalesce")),
            0)
            << options;
        EXPECT_EQ(getDurations(*animation), (std::vector{100, 250, 70, 500}));
        if (std::string(options) == "-loop 3") {
            EXPECT_EQ(animation->GetLoopCount(), 3);
        }
        // Back, and the same frame again.
        const CRGBAImage second = animation->GetFrame(1);
        animation->GetFrame(3);
        EXPECT_EQ(animation->GetFrame(1), second);
        EXPECT_EQ(animation->GetFrame(1), second);
        EXPECT_THROW(animation->GetFrame(4), peru::CInvalidArgError);
        // The toolkit finds the handler by the content.
        graphics::registerImageHandlers();
        const wxString path = wxString::FromUTF8((folder.path() / "a.gif").string());
        EXPECT_EQ(wxImage::GetImageCount(path), 4);
        wxImage image;
        ASSERT_TRUE(image.LoadFile(path, wxBITMAP_TYPE_ANY, 1));
        EXPECT_EQ(peru::gui::fromWxImage(image), second);
    }
}

TEST(Animation, ComposesMngLikeThePeer) {
    const tests::CTempFolder folder;
    // Theirs, without disposal: their reader and writer disagree about its durations.
    makeScene(folder, "", "a.gif");
    tests::runImageTool(folder.path(), "a.gif -coalesce -set dispose none -loop 0 a.mng");
    const auto theirs = OpenAnimation(tests::readFile(folder.path() / "a.mng"));
    EXPECT_EQ(tests::compare(getFrames(*theirs), tests::readByImageTool(folder.path(), "a.mng -coalesce")),
              0);
    EXPECT_EQ(getDurations(*theirs), (std::vector{100, 250, 70, 500}));
    EXPECT_EQ(theirs->GetLoopCount(), 0);
    EXPECT_EQ(theirs->GetFrame(1), theirs->GetFrame(1));
    // Ours; theirs reads hundredths of a second only.
    for (const auto& [durations, loops] :
         {std::pair(std::vector{40, 10, 300, 50}, 7), {{33, 1, 30000, 5}, 2}, {{10, 10}, 0}, {{10}, 1}}) {
        const std::string bytes = makeMng(durations, loops);
        const auto ours = OpenAnimation(bytes);
        EXPECT_EQ(getDurations(*ours), durations);
        EXPECT_EQ(ours->GetLoopCount(), loops);
        folder.write("ours.mng", bytes);
        if (durations[0] % 10 == 0) {
            EXPECT_EQ(getFrames(*ours), tests::readByImageTool(folder.path(), "ours.mng"));
        }
    }
}

TEST(Animation, ReportsDamage) {
    const tests::CTempFolder folder;
    const std::string gif = makeScene(folder, "", "a.gif"), mng = makeMng({10, 20, 30}, 2);
    for (const std::string& bytes : {gif, mng}) {
        int failures = 0;
        tests::damage(bytes, [&](const std::string& damaged) {
            try {
                getFrames(*OpenAnimation(damaged));
            } catch (const peru::CError&) {
                ++failures;
            }
        });
        EXPECT_GE(failures, 60); // at least those that are cut off
    }
    EXPECT_THROW(OpenAnimation("neither"), peru::CError);
    EXPECT_THROW(OpenAnimation(gif.substr(0, 13) + ";"), peru::CError); // no frame
}
