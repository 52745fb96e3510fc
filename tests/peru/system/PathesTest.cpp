#include "support/Environment.h"
#include "support/Files.h"

#include "peru/uri/URI.h"

#include <random>

using namespace peru;
using tests::CEnvironment;
using tests::errorOf;
using tests::text;

namespace {

std::string toPath(const char* uri) {
    return tests::toPath(make<CURI>(uri));
}

std::string expand(const std::string& value) {
    return text(getPathes()->expandEnvironment(CString::fromUTF8(value)));
}

std::string unexpand(const std::string& value) {
    return text(getPathes()->unexpandEnvironment(CString::fromUTF8(value)));
}

} // namespace

TEST(Pathes, ComeBackByteForByteThroughTheTextOfTheURI) {
    std::vector<std::string> paths{"/",
                                   "/100%25/50% off#1?x=y&z.mp3",
                                   "/new\nline and  blanks\t",
                                   "/folder/",
                                   "/\xed\xa0\x80",
                                   "//two/slashes",
                                   "/back\\slash",
                                   "C:\\x",
                                   "relative/a:b",
                                   "../up/one"};
    std::mt19937 random(7);
    for (int i = 0; i < 2000; ++i) {
        std::string name = i % 2 ? "/" : "x";
        for (size_t length = 1 + random() % 12; length > 0; --length) {
            const char ch = static_cast<char>(1 + random() % 255);
            name += ch == '/' || ch == '.' ? 'x' : ch;
        }
        paths.push_back(name);
    }
    for (const std::string& path : paths) {
        P<IURI> uri = tests::toURI(path);
        EXPECT_EQ(tests::toPath(uri), path);
        EXPECT_EQ(uri->isRelative(), path[0] != '/') << path;
        P<IURI> parsed = make<CURI>(uri->getAsString());
        EXPECT_EQ(tests::toPath(parsed), path) << text(uri->getAsString());
        EXPECT_EQ(uri->getAsString()->startsWith("file:///"), path[0] == '/') << text(uri->getAsString());
    }
}

TEST(Pathes, RefuseWhatIsNotOnThisMachine) {
    for (const char* elsewhere : {"http://host/a.mp3", "file://server/share/a.mp3", "//server/share",
                                  "winresicon:shell32.dll,-1", "file:///a%00b", ""})
        EXPECT_EQ(toPath(elsewhere), "") << elsewhere;
    EXPECT_EQ(tests::toPath(nullptr), "");
    EXPECT_EQ(toPath("file://localhost/a"), "/a");
    EXPECT_EQ(toPath("FILE:///a"), "/a");
    EXPECT_EQ(toPath("file:///a?query#fragment"), "/a");
}

TEST(Pathes, AreTerminatedAndShownAsValidText) {
    P<IURI> uri = tests::toURI("/a\xff");
    P<IString> path = getPathes()->toPlatformPath(uri);
    EXPECT_TRUE(path->isTerminated());
    EXPECT_STREQ(reinterpret_cast<const char*>(path->getData()), "/a\xff");
    EXPECT_EQ(text(getPathes()->toPlatformPath(uri, true)), "/a\xef\xbf\xbd");
    EXPECT_EQ(text(getPathes()->toPlatformPath(tests::toURI("/\xc3\xa4"), true)), "/\xc3\xa4");
}

TEST(Pathes, JoinAndSplitAtTheLastSeparator) {
    using SCase = std::array<const char*, 3>;
    for (const auto& [folder, name, joined] :
         {SCase{"/a", "b", "/a/b"}, SCase{"/a/", "b", "/a/b"}, SCase{"", "b", "b"}, SCase{"/", "b", "/b"},
          SCase{"/a", "/b", "/a/b"}, SCase{"/a/", "", "/a/"}}) {
        EXPECT_EQ(text(getPathes()->join(folder, name)), joined);
    }
    for (const auto& [folder, name, joined] :
         {SCase{"/a/", "b", "/a/b"}, SCase{"", "b", "b"}, SCase{"/a/b/", "", "/a/b/"}, SCase{"/", "b", "/b"},
          SCase{"", "", ""}}) {
        P<IString> front, back;
        getPathes()->split(joined, front, back);
        EXPECT_EQ(text(front) + "|" + text(back), std::string(folder) + "|" + name);
    }
}

TEST(Pathes, ExpandTheEnvironment) {
    CEnvironment value("TW_TEST_A", "/x y/\xff");
    CEnvironment empty("TW_TEST_EMPTY", "");
    CEnvironment undefined("TW_TEST_NONE", nullptr);
    EXPECT_EQ(expand("$TW_TEST_A/b"), "/x y/\xff/b");
    EXPECT_EQ(expand("a${TW_TEST_A}b$TW_TEST_A"), "a/x y/\xff"
                                                  "b/x y/\xff");
    EXPECT_EQ(expand("${TW_TEST_EMPTY}a$TW_TEST_EMPTY"), "a");
    for (const char* same :
         {"$TW_TEST_NONE/a", "${TW_TEST_NONE}", "100$", "$", "$$", "$1", "${}", "${a-b}", ""})
        EXPECT_EQ(expand(same), same);
    EXPECT_EQ(errorOf([] { expand("a${TW_TEST_A"); }), "error expanding environmental string");
}

TEST(Pathes, UnexpandToTheLongestFolderThatExpandsBack) {
    CEnvironment home("HOME", "/home/user");
    CEnvironment data("XDG_DATA_HOME", "/home/user/.local/share");
    CEnvironment configuration("XDG_CONFIG_HOME", "relative");
    CEnvironment temporary("TMPDIR", "/scratch/");
    const std::pair<std::string, std::string> cases[] = {
        {"/home/user", "$HOME"},
        {"/home/user/a b", "$HOME/a b"},
        {"/home/username", "/home/username"},
        {"/home/user/.local/share/x", "$XDG_DATA_HOME/x"},
        {"/scratch/x", "${TMPDIR}x"},
        {"relative/x", "relative/x"},
        {"/elsewhere/$5", "/elsewhere/$5"},
        {"", ""},
    };
    for (const auto& [path, expected] : cases) {
        EXPECT_EQ(unexpand(path), expected);
        EXPECT_EQ(expand(unexpand(path)), path);
    }
    for (const char* path : {"/data/$HOME", "/data/${open", "/home/user/${HOME}"})
        EXPECT_EQ(errorOf([&] { unexpand(path); }), "error unexpanding environmental string") << path;
}
