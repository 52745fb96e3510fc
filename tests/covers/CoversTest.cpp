// The program for graphic documents, with the example design.
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>

#include <array>
#include <cairo.h>
#include <cmath>
#include <memory>
#include <nlohmann/json.hpp>
#include <set>
#include <sstream>

namespace {

using namespace tests;
using nlohmann::json;
using testing::AllOf;
using testing::HasSubstr;

// The font library's configuration is never released.
const std::vector<std::pair<std::string, std::string>> kEnvironment{
    {"LC_ALL", "C.UTF-8"},
    {"LSAN_OPTIONS", "print_suppressions=0:suppressions=" TONEWRIGHT_TEST_DATA "/font-leaks.supp"}};

using Picture = std::unique_ptr<cairo_surface_t, void (*)(cairo_surface_t*)>;

Picture readPng(const std::filesystem::path& file) {
    return {cairo_image_surface_create_from_png(file.c_str()), cairo_surface_destroy};
}

// Calls the function with the place and the channels of each pixel, on white.
template <class Use> void forEachPixel(const Picture& picture, const Use& use) {
    const int stride = cairo_image_surface_get_stride(picture.get());
    for (int y = 0; y < cairo_image_surface_get_height(picture.get()); ++y)
        for (int x = 0; x < cairo_image_surface_get_width(picture.get()); ++x) {
            const unsigned char* const p =
                cairo_image_surface_get_data(picture.get()) + y * stride + x * 4; // blue first
            const bool hasAlpha = cairo_image_surface_get_format(picture.get()) == CAIRO_FORMAT_ARGB32;
            const int white = hasAlpha ? 255 - p[3] : 0;
            use(x, y, std::array{p[2] + white, p[1] + white, p[0] + white});
        }
}

// The mean of each channel in each block.
std::vector<double> getBlocks(const Picture& picture, int columns, int rows) {
    constexpr int kBlock = 24; // pixels
    std::vector<double> blocks(static_cast<size_t>(columns * rows * 3));
    forEachPixel(picture, [&](int x, int y, const std::array<int, 3>& channels) {
        if (x / kBlock >= columns || y / kBlock >= rows) return;
        const auto block = static_cast<size_t>(y / kBlock * columns + x / kBlock);
        for (size_t i = 0; i < 3; ++i) blocks[3 * block + i] += channels[i] / double{kBlock * kBlock};
    });
    return blocks;
}

class Covers : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(run({"python3", "-B", TONEWRIGHT_DOCS "/examples/showcase.py", "show.xml"}, folder.path())
                      .exitCode,
                  0);
    }
    // Without any display. A hanging program is killed.
    SProcessResult covers(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"timeout", "-s", "KILL", "60", "env", "-u", "DISPLAY", "-u",
                                             "WAYLAND_DISPLAY", TONEWRIGHT_PROGRAM});
        return run(arguments, folder.path(), kEnvironment);
    }
    std::string succeed(const std::vector<std::string>& arguments) {
        const SProcessResult result = covers(arguments);
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_EQ(result.err, "");
        return result.out;
    }
    std::string peer(const std::vector<std::string>& command) {
        const SProcessResult result = run(command, folder.path());
        EXPECT_EQ(result.exitCode, 0) << command[0] << ": " << result.out << result.err;
        return result.out;
    }
    std::string read(const std::string& name) { return readFile(folder / name); }

    CTempFolder folder;
};

TEST_F(Covers, ConversionsPreserveDesigns) {
    succeed({"convert", "show.xml", "-o", "show.cedprj", "--lossless"});
    peer({"unzip", "-tq", "show.cedprj"});
    for (const std::string item : {"1", "2"})
        for (const std::string file : {"show.xml", "show.cedprj"})
            succeed({"render", file, "-o", file + item + ".png", "--item", item, "--dpi", "60"});
    for (const std::string item : {"1", "2"})
        EXPECT_EQ(read("show.xml" + item + ".png"), read("show.cedprj" + item + ".png"));

    succeed({"convert", "show.cedprj", "-o", "again.xml"});
    succeed({"convert", "again.xml", "-o", "again.cedprj"});
    succeed({"convert", "again.cedprj", "-o", "last.xml"});
    EXPECT_EQ(read("again.xml"), read("last.xml"));
    peer({"xmllint", "--noout", "--schema", TONEWRIGHT_DOCS "/project.xsd", "last.xml"});
    const auto describe = [&](const std::string& name) {
        const json info = json::parse(succeed({"info", name, "--json"}));
        return info["targets"].dump() + info["creator"].dump() + info["cutMarks"].dump();
    };
    EXPECT_EQ(describe("show.xml"), describe("last.xml"));
    EXPECT_THAT(succeed({"info", "show.cedprj"}),
                AllOf(HasSubstr("cut marks       yes\n"), HasSubstr("jewel-case 2    151.0 x 118.0 mm\n"),
                      HasSubstr(" 2 circle, 1 image, 1 text, 2 text-circle\n"), HasSubstr(" 6 image ("),
                      HasSubstr("), 27 text (")));
    EXPECT_THAT(describe("show.cedprj"), AllOf(HasSubstr("text-circle\":2"), HasSubstr("\"width\":151.0")));
}

TEST_F(Covers, AllFormatsShowTheSamePicture) {
    struct SCase {
        const char *target, *item, *size;
        int columns, rows; // whole blocks
    };
    for (const SCase& c : {SCase{"jewel-case", "1", "121.0 x 121.0", 39, 39},
                           {"jewel-case", "2", "151.0 x 118.0", 49, 38},
                           {"disc", "1", "117.0 x 117.0", 38, 38}}) {
        for (const std::string name : {"show.png", "show.pdf", "show.svg"}) {
            std::vector<std::string> arguments{"render", "show.xml", "-o",   name, "--target",
                                               c.target, "--item",   c.item, "-f"};
            if (name == "show.png") arguments.insert(arguments.end(), {"--dpi", "200"});
            EXPECT_THAT(succeed(arguments),
                        HasSubstr(name + ": " + c.target + " " + c.item + ", " + c.size + " mm, "));
        }
        peer({"xmllint", "--noout", "show.svg"});
        peer({"pdftoppm", "-r", "200", "-png", "-singlefile", "show.pdf", "page"});
        const auto painted = getBlocks(readPng(folder / "show.png"), c.columns, c.rows),
                   page = getBlocks(readPng(folder / "page.png"), c.columns, c.rows);
        double worst = 0;
        for (size_t i = 0; i < painted.size(); ++i) worst = std::max(worst, std::abs(painted[i] - page[i]));
        EXPECT_LT(worst, 20) << c.target << c.item;
    }
    EXPECT_THAT(peer({"pdfinfo", "show.pdf"}), AllOf(HasSubstr("331.65"), HasSubstr("2000"))); // a fixed date
    EXPECT_THAT(peer({"pdftotext", "show.pdf", "-"}), HasSubstr("Showcase"));

    succeed({"render", "show.xml", "-o", "show.png", "--target", "6", "--dpi", "100", "--grey", "--force"});
    bool isGrey = true;
    forEachPixel(readPng(folder / "show.png"), [&](int, int, const std::array<int, 3>& channels) {
        isGrey = isGrey && channels[0] == channels[1] && channels[0] == channels[2];
    });
    EXPECT_TRUE(isGrey);
}

TEST_F(Covers, PicturesComeFromTheFilesThatAreNamed) {
    succeed({"images", "show.xml", "-d", "."});
    std::string xml = read("show.xml");
    const std::string image = "<image ";
    for (size_t at = 0; (at = xml.find(image, at)) != std::string::npos; ++at)
        xml.insert(at + image.size(), "filename=\"image0.png\" ");
    folder.write("named.xml", xml);
    succeed({"convert", "named.xml", "-o", "short.xml", "--file-names"});
    EXPECT_THAT(read("short.xml"), testing::Not(HasSubstr("attachment-bitmap")));
    EXPECT_THAT(covers({"render", "short.xml", "-o", "a.png", "--dpi", "30"}).err,
                HasSubstr("its name only"));
    succeed({"render", "short.xml", "-o", "a.png", "--dpi", "30", "--file-names", "-f"});
}

TEST_F(Covers, ImagesAreTheStoredAttachments) {
    succeed({"convert", "show.xml", "-o", "show.cedprj"});
    succeed({"images", "show.cedprj", "-d", "new/out"});
    std::set<std::string> types;
    for (const auto& file : std::filesystem::directory_iterator(folder / "new/out")) {
        const std::string name = file.path().filename();
        if (name > "text1") continue;
        EXPECT_EQ(readFile(file.path()), peer({"unzip", "-p", "show.cedprj", name}));
        if (name.starts_with("image"))
            types.insert(name.substr(name.find('.')) + peer({"exiftool", "-s3", "-FileType", file.path()}));
    }
    EXPECT_EQ(types, (std::set<std::string>{".jpgJPEG\n", ".jngJNG\n"}));
    // Nothing is written if one of the files exists.
    std::filesystem::remove(folder / "new/out/image1.jpg");
    EXPECT_EQ(covers({"images", "show.cedprj", "-d", "new/out"}).exitCode, 1);
    EXPECT_FALSE(std::filesystem::exists(folder / "new/out/image1.jpg"));

    // Names and extensions of entries never lead out of the folder.
    std::string xml = read("show.xml");
    const std::string found = "<attachment-bitmap extension=\"png\">";
    xml.replace(xml.find(found), found.size(),
                "<attachment-bitmap extension=\"/../x\"><base64>Zmlyc3Q=</base64></attachment-bitmap>"
                "<attachment-bitmap name=\"../../escaped.png\" extension=\"png\">");
    folder.write("evil.xml", xml);
    EXPECT_EQ(covers({"images", "evil.xml", "-d", "evil/out"}).exitCode, 0);
    EXPECT_FALSE(std::filesystem::exists(folder / "escaped.png"));
    EXPECT_EQ(read("evil/out/image0.bin"), "first");
    EXPECT_EQ(read("evil/out/image1.png").substr(1, 3), "PNG");
}

TEST_F(Covers, FailuresNameTheReasonAndKeepFiles) {
    succeed({"convert", "show.xml", "-o", "show.cedprj"});
    folder.write("cut.cedprj", read("show.cedprj").substr(0, 5000));
    folder.write("text.xml", "no project");
    folder.write("kept.png", "kept");
    folder.write("kept.xml", "kept");
    struct SCase {
        const char* arguments;
        int exitCode;
        const char* message;
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"", 2, "A subcommand is required"},
             {"info none.cedprj", 1, "tonewright-covers: none.cedprj: No such file"},
             {"info cut.cedprj", 1, "tonewright-covers: cut.cedprj: The archive is damaged"},
             {"info text.xml", 1, "tonewright-covers: text.xml: \"XML\" could not be read"},
             {"render show.xml -o kept.png", 1, "kept.png exists (--force replaces it)"},
             {"render show.xml -o new.png --target 1", 1, "only jewel-case 1, jewel-case 2, disc 1"},
             {"render show.xml -o new.png --dpi 4800", 1, "pixels is not possible"},
             {"render cut.cedprj -o kept.png -f", 1, "The archive is damaged"},
             {"render show.xml -o none/new.png", 1, "none/new.png could not be written: "},
             {"render show.xml -o new.jpg", 2, "new.jpg does not end in one of .png, .pdf, .svg"},
             {"render show.xml -o new.pdf --dpi 9", 2, "--dpi: applies to .png files only"},
             {"render show.xml -o new.png --dpi nan", 2, "--dpi: is not a number"},
             {"convert show.xml -o show.xml -f", 1, "Input and output are the same file"},
             {"convert show.cedprj -o kept.xml", 1, "kept.xml exists"},
             {"convert show.cedprj -o new.xml --lossless", 2, "applies to .cedprj files only"},
         }) {
        std::istringstream words(c.arguments);
        const SProcessResult result = covers({std::istream_iterator<std::string>(words), {}});
        EXPECT_EQ(result.exitCode, c.exitCode) << result.err;
        EXPECT_THAT(result.err, HasSubstr(c.message));
        EXPECT_THAT(result.err, testing::Not(HasSubstr("file://")));
    }
    for (const char* name : {"kept.png", "kept.xml"}) EXPECT_EQ(read(name), "kept");
    for (const auto& file : std::filesystem::directory_iterator(folder.path()))
        EXPECT_FALSE(file.path().filename().string().starts_with("new")) << file;

    // A missing picture is a warning.
    peer({"7z", "d", "show.cedprj", "image1.jpg"});
    const SProcessResult result = covers({"render", "show.cedprj", "-o", "new.png", "--dpi", "20"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.err, HasSubstr("image1.jpg"));
    EXPECT_EQ(covers({"images", "show.cedprj", "-d", "rest"}).exitCode, 1);
    EXPECT_TRUE(std::filesystem::exists(folder / "rest/image2.jng"));
    const json error = json::parse(covers({"info", "--json", "cut.cedprj"}).out);
    EXPECT_THAT(error["error"].get<std::string>(), HasSubstr("The archive is damaged"));
}

TEST_F(Covers, CtrlC_LeavesNothingHalfWritten) {
    for (const std::string delay : {"0.01", "0.05", "0.1", "0.2"}) {
        const SProcessResult result =
            run({"timeout", "--preserve-status", "-s", "INT", "-k", "60", delay, TONEWRIGHT_PROGRAM, "render",
                 "show.xml", "-o", "new.png", "--dpi", "200", "-f"},
                folder.path(), kEnvironment);
        EXPECT_TRUE(result.exitCode == 0 || result.exitCode == 130) << result.exitCode << result.err;
        for (const auto& file : std::filesystem::directory_iterator(folder.path()))
            EXPECT_TRUE(file.path().filename() == "show.xml" || file.path().filename() == "new.png") << file;
        const bool isWritten = std::filesystem::exists(folder / "new.png");
        EXPECT_EQ(cairo_surface_status(readPng(folder / "new.png").get()),
                  isWritten ? CAIRO_STATUS_SUCCESS : CAIRO_STATUS_FILE_NOT_FOUND);
    }
}

} // namespace
