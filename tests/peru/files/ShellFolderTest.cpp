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
        const SFileAttributes attributes = item->getAttributes();
        std::string& entry = listing[tests::toPath(item->getURI())];
        entry = text(item->getName()) + " " + std::to_string(item->getSize());
        for (const bool flag :
             {item->isFolder(), item->isFile(), attributes.hidden, attributes.link, attributes.executable})
            entry += flag ? " yes" : " no";
    }
    return listing;
}

} // namespace

TEST(ShellFolder, AgreesWithTheFileSystemAndRaisesItsFixedTexts) {
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

    for (const char* name : {"sub folder", "100%25#?.txt"}) {
        const P<IURI> item = toURI(folder / name);
        getFileSystemManager()->setTimes(
            item, make<CFileTimes>(CFileTimes::kUnknown, 1234567891000, 98765432109876000));
        const P<IFileObject> ours = getFileSystemManager()->getFileObject(item);
        const P<posix::CShellFileObject> theirs = posix::CShellFileObject::find(item);
        for (const P<IString>& shown :
             {ours->getDisplayName(), theirs->getDisplayName(), shell->getItemName(name)})
            EXPECT_EQ(text(shown), name);
        EXPECT_EQ(text(ours->getKind()), text(theirs->getKind()));
        EXPECT_EQ(ours->getTimes()->getLastAccessTime(), theirs->getTimes()->getLastAccessTime());
        EXPECT_EQ(theirs->getTimes()->getLastWriteTime(), 98765432109876000);
        EXPECT_FALSE(theirs->getKindDescription()->isEmpty() || theirs->getIconName()->isEmpty());
    }
    EXPECT_EQ(tests::toPath(shell->getURI()), folder.path().string());
    EXPECT_TRUE(posix::CDesktopFileObject::get()->isFolder());
    const P<IURI> file = toURI(folder / "tool");
    EXPECT_EQ(errorOf([&] { posix::CShellFolder::bind(file); }), "Error binding to shell folder.");
    EXPECT_EQ(errorOf([&] { posix::CShellFileObject::find(file)->enumerate(); }),
              "Error enumerating shell folder contents.");
    EXPECT_EQ(errorOf([&] { shell->getItemAttributes("none"); }),
              "Error obtaining shell folder item information.");
    EXPECT_EQ(errorOf([&] { posix::CShellFileObject::find(make<CURI>("//host/x")); }),
              "Error obtaining ITEMIDLIST from path or name:");
}
