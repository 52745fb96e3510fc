#include "support/Files.h"

#include "peru/uri/URI.h"
#include "peru/uri/WindowsPath.h"

using namespace peru;
using tests::text;

namespace {

std::string toWindows(const std::string& uri, bool knowsLongForm = true) {
    return text(toWindowsPath(make<CURI>(CString::fromUTF8(uri)), knowsLongForm));
}

std::string fromWindows(const std::string& path) {
    return text(fromWindowsPath(CString::fromUTF8(path))->getAsString());
}

std::string fill(const std::string& start, size_t length) {
    return start + std::string(length - start.size(), 'a');
}

} // namespace

TEST(WindowsPath, FollowsTheGrammarBothWays) {
    const std::pair<const char*, const char*> cases[] = {
        {"file:///C:/Music/a%20b.wav", "C:\\Music\\a b.wav"},
        {"file://server/share/x.wav", "\\\\server\\share\\x.wav"},
        {"file://server/", "\\\\server\\"},
        {"music/a.wav", "music\\a.wav"},
        {"file:///C:/", "C:\\"},
        {"file:///C:/%E4%BD%A0%23%25.mp3", "C:\\\xe4\xbd\xa0#%.mp3"},
    };
    for (const auto& [uri, path] : cases) {
        EXPECT_EQ(toWindows(uri), path);
        EXPECT_EQ(fromWindows(path), uri);
    }
    for (const char* other : {"", "http://server/a", "winresicon:shell32.dll,-1"})
        EXPECT_EQ(toWindows(other), "");
    EXPECT_EQ(fromWindows("C:/mixed\\x"), "file:///C:/mixed/x");
    EXPECT_EQ(fromWindows("\\\\?\\C:\\x"), "file:///C:/x");
    EXPECT_EQ(fromWindows("\\\\?\\UNC\\server\\share\\x"), "file://server/share/x");
}

TEST(WindowsPath, TakesTheLongFormFrom240UnitsUpwards) {
    const std::string drive = fill("C:\\", 240), share = fill("\\\\server\\share\\", 300),
                      relative = fill("music\\", 240);
    std::string notes = "C:\\"; // the platform counts two units for each of these characters
    for (int i = 0; i < 118; ++i) notes += "\xf0\x9f\x8e\xb5";
    for (const std::string& path : {fill("C:\\", 239), notes}) EXPECT_EQ(toWindows(fromWindows(path)), path);
    notes += "\xf0\x9f\x8e\xb5";
    for (const auto& [path, longForm] : {std::pair(drive, "\\\\?\\" + drive),
                                         {notes, "\\\\?\\" + notes},
                                         {share, "\\\\?\\UNC\\" + share.substr(2)}}) {
        EXPECT_EQ(toWindows(fromWindows(path)), longForm);
        EXPECT_EQ(fromWindows(longForm), fromWindows(path));
    }
    for (const auto& [path, knowsLongForm] : {std::pair(drive, false), {share, false}, {relative, true}})
        EXPECT_EQ(tests::errorOf([&] { toWindows(fromWindows(path), knowsLongForm); }),
                  "Error: Windows path is longer than MAX_PATH and the limit cannot be circumvented (path='" +
                      path + "')");
}
