// How changes are written to disk.
#include "Support.h"
#include "filetag/taglib/TagLibIOStream.h"

#include <tbytevectorstream.h>

#include <random>

using namespace peru;
using filetag::IFileTag;
using filetag::taglib::CTagLibIOStream;
using tests::CTempFolder;
using tests::toURI;

namespace {

// Whether the operation writes to the file itself instead of replacing it, detected with a hard link.
template <class Operation> bool isInPlace(const std::filesystem::path& file, Operation operation) {
    const std::filesystem::path second = file.string() + ".second";
    std::filesystem::remove(second);
    std::filesystem::create_hard_link(file, second);
    operation();
    return std::filesystem::equivalent(file, second);
}

void setTitle(const std::filesystem::path& file, const std::string& title) {
    const P<IFileTag> tag = tests::open(file);
    tag->setTitle(tests::fromStandard(title));
    tag->store();
}

std::string toStdString(const TagLib::ByteVector& bytes) {
    return std::string(bytes.data(), bytes.size());
}

} // namespace

// Compared with TagLib's own memory stream.
TEST(TagStream, DoesWhatAFileDoes) {
    const CTempFolder folder;
    std::mt19937 random(7);
    const auto below = [&random](long limit) {
        return static_cast<long>(random() % static_cast<unsigned>(limit));
    };
    const auto makeBytes = [&](long size) {
        TagLib::ByteVector bytes(static_cast<unsigned int>(size), '\0');
        for (char& byte : bytes) byte = static_cast<char>('a' + below(26));
        return bytes;
    };
    for (int round = 0; round < 25; ++round) {
        SCOPED_TRACE(round);
        const TagLib::ByteVector old = makeBytes(below(600000));
        const auto file = folder.write("file", toStdString(old));
        CTagLibIOStream stream(toURI(file));
        TagLib::ByteVectorStream model(old);
        for (int step = 0; step < 60; ++step) {
            const long position = below(model.length() + 1);
            switch (below(12)) {
            case 0: {
                const TagLib::ByteVector bytes = makeBytes(below(5000));
                const auto replaced = static_cast<unsigned long>(below(5000));
                stream.insert(bytes, static_cast<unsigned long>(position), replaced);
                model.insert(
                    bytes, static_cast<unsigned long>(position),
                    std::min<unsigned long>(replaced, static_cast<unsigned long>(model.length() - position)));
                break;
            }
            case 1: {
                const auto size =
                    static_cast<unsigned long>(below(std::min(model.length() - position, 5000L) + 1));
                stream.removeBlock(static_cast<unsigned long>(position), size);
                model.removeBlock(static_cast<unsigned long>(position), size);
                break;
            }
            case 2:
                if (below(5) > 0) break;
                stream.truncate(position);
                model.truncate(position);
                break;
            case 3:
            case 4:
            case 5:
            case 6: {
                stream.seek(position, TagLib::IOStream::Beginning);
                model.seek(position);
                // Not beyond the end, where the memory stream exposes old content.
                const TagLib::ByteVector bytes =
                    makeBytes(below(std::min(model.length() - position, 300L) + 1));
                stream.writeBlock(bytes);
                model.writeBlock(bytes);
                break;
            }
            default:
                stream.seek(position - model.length(), TagLib::IOStream::End);
                ASSERT_EQ(stream.tell(), position);
                model.seek(position);
                ASSERT_TRUE(stream.readBlock(10000) == model.readBlock(10000)) << step;
            }
            ASSERT_EQ(stream.length(), model.length()) << step;
        }
        EXPECT_TRUE(tests::readFile(file) == toStdString(old)) << "nothing reaches the file before";
        stream.commit();
        EXPECT_TRUE(tests::readFile(file) == toStdString(*model.data()));
    }
}

TEST(TagStream, WritesBehindTheEnd) {
    const CTempFolder folder;
    const auto file = folder.write("file", "old");
    CTagLibIOStream stream(toURI(file));
    stream.seek(5, TagLib::IOStream::Beginning);
    stream.writeBlock("new");
    stream.seek(-6, TagLib::IOStream::Current);
    EXPECT_EQ(toStdString(stream.readBlock(100)), std::string("d\0\0new", 6));
    stream.truncate(10);
    stream.commit();
    EXPECT_EQ(tests::readFile(file), std::string("old\0\0new\0\0", 10));
}

TEST(TagStream, WritesSmallChangesInPlaceAndOthersAside) {
    const CTempFolder folder;
    const std::string old(3 * 4096, 'o');
    const struct {
        long position;
        long size;
        bool inPlace;
    } changes[] = {{0, 4096, true}, {4096, 4096, true}, {4095, 2, false}, {5000, 1, true}, {0, 8192, false}};
    for (const auto& change : changes) {
        SCOPED_TRACE(change.position);
        const auto file = folder.write(std::to_string(&change - changes), old);
        CTagLibIOStream stream(toURI(file));
        // The rest is rewritten unchanged, as TagLib does when it writes whole tags.
        const TagLib::ByteVector bytes(static_cast<unsigned int>(change.size), 'n');
        stream.insert(TagLib::ByteVector(old.c_str(), static_cast<unsigned int>(old.size())), 0, old.size());
        stream.seek(change.position, TagLib::IOStream::Beginning);
        stream.writeBlock(bytes);
        EXPECT_EQ(isInPlace(file, [&] { stream.commit(); }), change.inPlace);
        EXPECT_TRUE(tests::readFile(file) == std::string(old).replace(static_cast<size_t>(change.position),
                                                                      static_cast<size_t>(change.size),
                                                                      toStdString(bytes)));
    }
}

TEST(TagStore, FollowsLinksAndUsesPadding) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "flac");
    std::filesystem::create_symlink("sound.flac", folder / "link.flac");
    const auto link = folder / "link.flac";
    // TagLib reduces the padding of a short file.
    EXPECT_FALSE(isInPlace(file, [&] { setTitle(link, "First"); }));
    EXPECT_TRUE(isInPlace(file, [&] { setTitle(link, "Another"); }));
    EXPECT_EQ(tests::run({"metaflac", "--show-tag=TITLE", file}).out, "TITLE=Another\n");
    EXPECT_FALSE(isInPlace(file, [&] { setTitle(link, std::string(20000, 'x')); }));
    EXPECT_TRUE(std::filesystem::is_symlink(link));
    EXPECT_EQ(tests::run({"flac", "-t", "-s", file}).exitCode, 0);
}
