#include "peru/desktop/posix/ShellFolder.h"

#include "support/Files.h"
#include "support/TempFolder.h"

#include "peru/files/IFileSystemManager.h"
#include "peru/uri/URI.h"

#include <map>

using namespace peru;
using tests::CTempFolder;
using tests::errorOf;
using tests::text;
using tests::toURI;

namespace {

using CListing = std::map<std::string, std::string>;

CListing list(const P<IFileObjectCursor>& cursor) {
    CListing listing;
    while (cursor->next()) {
        P<IFileObject> item = cursor->getFileObject();
        SFileAttributes attributes = item->getAttributes();
        listing[tests::toPath(item->getURI())] =
            text(item->getName()) + " " + std::to_string(item->getSize()) +
            (item->isFolder() ? " folder"
             : item->isFile() ? " file"
                              : "") +
            (attributes.hidden ? " hidden" : "") + (attributes.link ? " link" : "") +
            (attributes.executable ? " executable" : "");
    }
    return listing;
}

} // namespace

TEST(ShellFolder, AgreesWithTheFileSystem) {
    CTempFolder folder;
    std::filesystem::create_directory(folder / "sub folder");
    folder.write(".hidden", "12");
    folder.write("\xff \xe4.wav", "123");
    folder.write("100%25#?.txt", "");
    std::filesystem::permissions(folder.write("tool", "x"), std::filesystem::perms::owner_all);
    std::filesystem::create_symlink(folder / "tool", folder / "link");
    P<posix::CShellFolder> shell = posix::CShellFolder::bind(toURI(folder.path()));
    CListing expected = list(getFileSystemManager()->enumerate(toURI(folder.path())));
    EXPECT_EQ(expected.size(), 6u);
    P<IFileObjectCursor> cursor = shell->enumerate();
    EXPECT_EQ(list(cursor), expected);
    cursor->reset();
    EXPECT_EQ(list(cursor), expected);
}

TEST(ShellFolder, RaisesItsFixedTexts) {
    CTempFolder folder;
    P<IURI> file = toURI(folder.write("a", ""));
    P<posix::CShellFolder> shell = posix::CShellFolder::bind(toURI(folder.path()));
    EXPECT_EQ(errorOf([&] { posix::CShellFolder::bind(file); }), "Error binding to shell folder.");
    EXPECT_EQ(errorOf([&] { posix::CShellFileObject::find(file)->enumerate(); }),
              "Error enumerating shell folder contents.");
    EXPECT_EQ(errorOf([&] { shell->getItemAttributes("none"); }),
              "Error obtaining shell folder item information.");
    EXPECT_EQ(errorOf([&] { posix::CShellFileObject::find(make<CURI>("//host/x")); }),
              "Error obtaining ITEMIDLIST from path or name:");
}
