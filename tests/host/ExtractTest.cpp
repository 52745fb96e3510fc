#include "host/Program.h"

using namespace tests;

namespace {

class Extract : public CProgramTest {
protected:
    void SetUp() override {
        std::filesystem::create_directories(folder / "in/Über uns/deep");
        std::filesystem::create_directories(folder / "in/empty");
        folder.write("in/Über uns/deep/a file.txt", "12345");
        folder.write("in/large", std::string(3'000'000, 'x'));
        peer({"touch", "-d", "@1000000000", "in/large"});
        peer({"genisoimage", "-quiet", "-R", "-J", "-joliet-long", "-input-charset", "utf-8", "-o",
              "disc.iso", "in"});
    }
};

} // namespace

TEST_F(Extract, CopiesWhatIsNamed) {
    succeed({"disc", "disc.iso", "--extract", "/", "-d", "all"});
    EXPECT_EQ(peer({"diff", "-r", "in", "all"}), "");
    EXPECT_EQ(peer({"stat", "-c", "%Y", "all/large"}), "1000000000\n");
    const std::vector<std::string> here{
        "sh", "-c", "mkdir here && cd here && exec \"$0\" disc ../disc.iso -x /", kProgram};
    EXPECT_EQ(run(here, folder.path()).exitCode, 0);
    EXPECT_EQ(peer({"diff", "-r", "in", "here"}), "");
    succeed({"disc", "disc.iso", "-d", "some", "-x", "Über uns/deep/a file.txt", "/Über uns/", "large"});
    EXPECT_EQ(readFile(folder / "some/a file.txt"), "12345");
    EXPECT_EQ(peer({"diff", "-r", "in/Über uns", "some/Über uns"}), "");
    folder.write("some/large", "old");
    EXPECT_TRUE(has(fail({"disc", "disc.iso", "-d", "some", "-x", "large"}), "(--force replaces it)"));
    EXPECT_EQ(readFile(folder / "some/large"), "old");
    succeed({"disc", "disc.iso", "-d", "some", "-x", "large", "-f"});
    EXPECT_EQ(readFile(folder / "some/large").size(), 3'000'000u);
}

TEST_F(Extract, FilesAreListed) {
    peer({"genisoimage", "-quiet", "-R", "-J", "-V", "LABEL", "-input-charset", "utf-8", "-o", "disc.iso",
          "in"});
    const std::string text = succeed({"disc", "disc.iso"});
    EXPECT_EQ(text.substr(text.find('\n')),
              "\nTitle: LABEL\ntrack    duration    start   blocks  pregap  title\n"
              "    1      0:22.0        0     1653     150  (data)\n"
              "            /empty/\n"
              "    3.0 MB  /large\n"
              "            /Über uns/\n"
              "            /Über uns/deep/\n"
              "       5 B  /Über uns/deep/a file.txt\n");
    const auto lines = parseLines(succeed({"disc", "disc.iso", "--json"}));
    ASSERT_EQ(lines.size(), 7u);
    EXPECT_EQ(lines[0]["capacity"], std::filesystem::file_size(folder / "disc.iso"));
    EXPECT_EQ(lines[1]["audio"], false);
    EXPECT_EQ(lines[5].dump() + lines[6].dump(),
              R"({"bytes":0,"file":"/Über uns/deep","folder":true})"
              R"({"bytes":5,"file":"/Über uns/deep/a file.txt","folder":false})");
    EXPECT_TRUE(has(fail({"rip", "disc.iso"}), "disc.iso has no audio tracks"));
}

TEST_F(Extract, RefusesNamesAndGoesOn) {
    for (const char* name : {"none", "large/none", "none/large"})
        EXPECT_EQ(
            fail({"disc", "disc.iso", "-d", "out", "-x", name}).find(std::string("tonewright: ") + name), 0u);
    // A name that would lead out of the folder.
    folder.write("in/XX_evil", "evil");
    peer({"genisoimage", "-quiet", "-R", "-o", "disc.iso", "in"});
    std::string bytes = readFile(folder / "disc.iso");
    const size_t place = bytes.find("XX_evil");
    ASSERT_NE(place, std::string::npos);
    folder.write("disc.iso", bytes.replace(place, 7, "../evil"));
    const std::string refused = fail({"disc", "disc.iso", "-d", "out/sub", "-x", "/"});
    EXPECT_TRUE(has(refused, "evil: The name cannot be that of a file"));
    EXPECT_FALSE(std::filesystem::exists(folder / "out/evil"));
    EXPECT_EQ(readFile(folder / "out/sub/large").size(), 3'000'000u);
    EXPECT_EQ(tonewright({"disc", "disc.iso", "-d", "out"}).exitCode, 2);
}
