#include "chf/ChunkFile.h"
#include "MemoryStream.h"
#include "chf/PeruFileStream.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

namespace {

using namespace chf;
using tests::chunk;
using tests::chunkFile;
using tests::CMemoryStream;

struct SFile {
    explicit SFile(const std::string& bytes)
        : storage(new CMemoryStream(bytes)), chunks(OpenChunkFile(storage.get())) {}
    TRef<CMemoryStream> storage;
    TRef<CChunkFile> chunks;
};

} // namespace

TEST(ChunkFile, SizesThatLieEndTheSequence) {
    const std::string body = chunk("aaaa", "12345");
    struct SCase {
        const char* name;
        std::string bytes;
        int chunks;
    };
    const SCase cases[] = {
        {"an empty file", "", 0},
        {"no content size", "TESTFILE", 0},
        {"no chunks", chunkFile(""), 0},
        {"11 bytes", chunkFile(std::string(11, 'x')), 0},
        {"one chunk", chunkFile(body), 1},
        {"11 bytes behind a chunk", chunkFile(body + std::string(11, 'x')), 1},
        {"a content that ends before its chunk", "TESTFILE" + tests::int64Bytes(12) + body, 1},
        {"a negative content size", "TESTFILE" + tests::int64Bytes(INT64_MIN) + body, 0},
        {"a content beyond the end", "TESTFILE" + tests::int64Bytes(INT64_MAX) + body, 1},
        {"a body beyond the end", chunkFile(body + "bbbb" + tests::int64Bytes(1000) + "x"), 2},
        {"a body of the largest size", chunkFile("bbbb" + tests::int64Bytes(INT64_MAX) + body), 1},
        {"a body that leads back", chunkFile(body + "bbbb" + tests::int64Bytes(-12) + body), 1},
        {"a body of the smallest size", chunkFile("bbbb" + tests::int64Bytes(INT64_MIN) + body), 0},
    };
    for (const SCase& c : cases) {
        SFile file(c.bytes);
        for (int round = 0; round < 2; ++round) {
            int count = 0;
            for (file.chunks->Rewind(); file.chunks->Next() && count < 9; ++count)
                for (auto nested = file.chunks->OpenIterator(); nested->Next();) nested->OpenStream();
            EXPECT_EQ(count, c.chunks) << c.name;
            EXPECT_EQ(file.chunks->GetId(), 0u) << c.name;
            EXPECT_THROW(file.chunks->OpenStream(), std::logic_error) << c.name;
        }
        file.chunks = {};
        EXPECT_EQ(file.storage->bytes, c.bytes) << c.name << ": reading has changed the file";
    }
    EXPECT_STREQ(SFile(chunkFile("")).chunks->GetSignature(), "TESTFILE");
}

TEST(ChunkFile, AReadPastTheEndOfAChunkContinuesInTheNextOne) {
    SFile file(chunkFile(chunk("aaaa", "123") + chunk("bbbb", "xyz")));
    ASSERT_TRUE(file.chunks->Next());
    EXPECT_EQ(file.chunks->GetId(), makeChunkId("aaaa"));
    auto stream = file.chunks->OpenStream();
    char bytes[7];
    EXPECT_EQ(stream->Read(bytes, 7), 7u);
    EXPECT_EQ(std::string(bytes, 7), "123bbbb");
    EXPECT_EQ(stream->GetPosition(), 3);
}

// More than one block behind the position: only the last one moves.
TEST(ChunkFile, InsertedSpaceMovesAtMostTheLastBlock) {
    std::string bytes(CBaseStream::kMoveSize + 1000, '\0');
    for (size_t i = 0; i < bytes.size(); ++i) bytes[i] = static_cast<char>(i * 7 + i / 256);
    TRef<CMemoryStream> stream(new CMemoryStream(bytes));
    stream->Seek(300);
    stream->InsertSpace(50);
    EXPECT_EQ(stream->GetPosition(), 300);
    ASSERT_EQ(stream->bytes.size(), bytes.size() + 50);
    EXPECT_EQ(stream->bytes.substr(0, 1050), bytes.substr(0, 1050));
    EXPECT_EQ(stream->bytes.substr(1050), bytes.substr(1000));

    stream->bytes = bytes;
    stream->Seek(300);
    stream->RemoveSpace(50);
    EXPECT_EQ(stream->bytes, bytes.substr(0, 300) + bytes.substr(350)) << "all blocks move";
    stream->bytes = "end";
    stream->Seek(3);
    stream->InsertSpace(50);
    EXPECT_EQ(stream->bytes.size(), 53u);
}

TEST(ChunkFile, AFileOnDiskGrowsButNeverShrinks) {
    tests::CTempFolder folder;
    const auto path = folder.write("file.chf", chunkFile(chunk("aaaa", "123") + chunk("bbbb", "xyz")));
    const std::string dashes(50, '-');
    {
        auto storage = CPeruFileStream::Open(tests::toURI(path), EFileAccess::update);
        auto file = OpenChunkFile(storage.get());
        file->Next();
        auto stream = file->OpenStream();
        stream->Seek(1);
        stream->InsertSpace(50); // more than what follows
        stream->Write(dashes.data(), 50);
        EXPECT_THROW(stream->RemoveSpace(1), std::exception);
        EXPECT_THROW(storage->Truncate(0), std::exception);
        EXPECT_THROW(storage->Grow(int64_t{1} << 40), std::exception);
    }
    const std::string grown = chunkFile(chunk("aaaa", "1" + dashes + "23") + chunk("bbbb", "xyz"));
    EXPECT_EQ(tests::readFile(path), grown);

    auto storage = CPeruFileStream::Open(tests::toURI(path), EFileAccess::read);
    EXPECT_THROW(storage->Write("x", 1), std::exception);
    auto file = OpenChunkFile(storage.get());
    file->Next();
    auto stream = file->OpenStream();
    stream->Seek(53);
    EXPECT_THROW(stream->Write("x", 1), std::exception);
    EXPECT_EQ(stream->GetSize(), 53);
    EXPECT_THROW(CPeruFileStream::Open(tests::toURI(folder / "none.chf"), EFileAccess::update),
                 std::exception);
}
