#include "peru/MemoryManager.h"
#include "peru/Errors.h"
#include "peru/streams/BufferedIOStream.h"
#include "peru/streams/DataStreams.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <random>
#include <thread>

namespace {

using namespace peru;

TEST(MemoryManager, BlocksAreAlignedAndLargeEnough) {
    const P<CMemoryManager> manager = make<CMemoryManager>();
    for (int64_t size : {0, 1, 64, 65, 4096, 1 << 24, (1 << 24) + 1}) {
        const P<IMemoryBlock> block = manager->getBlock(size);
        EXPECT_EQ(block->getSize(), size);
        EXPECT_GE(block->getCapacity(), size);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(block->getData()) % 64, 0u) << size;
    }
    EXPECT_THROW(manager->getBlock(-1), CInvalidArgError);
}

TEST(MemoryManager, ReleasedBlocksAreReusedUpToTheLimit) {
    const P<CMemoryManager> manager = make<CMemoryManager>(2);
    const uint8_t* data = manager->getBlock(1000)->getData();
    EXPECT_EQ(manager->getCachedBytes(), 1024);
    EXPECT_EQ(manager->getBlock(600)->getData(), data);
    {
        const P<IMemoryBlock> a = manager->getBlock(1000), b = manager->getBlock(1000),
                              c = manager->getBlock(1000);
        EXPECT_EQ(manager->getCachedBytes(), 0);
    }
    EXPECT_EQ(manager->getCachedBytes(), 2048);
    manager->getBlock((int64_t{1} << 24) + 1); // too large to be kept
    EXPECT_EQ(manager->getCachedBytes(), 2048);
}

TEST(MemoryManager, GrownBlockServesTheClassItCanFill) {
    P<CMemoryManager> manager = make<CMemoryManager>();
    P<IMemoryBlock> block = manager->getBlock(100);
    std::memset(block->getData(), 7, 100);
    block->setSize(1500);
    EXPECT_EQ(block->getData()[99], 7);
    block = nullptr;
    block = manager->getBlock(1024);
    EXPECT_GE(block->getCapacity(), 1500);
    EXPECT_EQ(block->getSize(), 1024);
    manager->getBlock(64); // in the free list when the manager is released
    manager = nullptr;
    std::memset(block->getData(), 1, 1024);
    block = nullptr; // destroys the manager and the cached block
}

TEST(MemoryManager, ReadingUsesABlockInStockOrGrowsAsBytesArrive) {
    const P<CMemoryManager> manager = make<CMemoryManager>();
    constexpr int32_t kSize = 300'000;
    const auto read = [&](int32_t stated, int32_t sent) {
        const P<CBufferedIOStream> stream = make<CBufferedIOStream>(make<CMemoryManager>());
        stream->write(&stated, sizeof stated);
        const std::string bytes(static_cast<size_t>(sent), 'x');
        stream->write(bytes.data(), sent);
        P<IMemoryBlock> block = manager->getBlock(1);
        if (stated == sent)
            block->readFrom(make<CDataInStream>(stream));
        else
            EXPECT_THROW(block->readFrom(make<CDataInStream>(stream)), CEndOfStreamError);
        return block;
    };
    EXPECT_LT(read(1 << 30, 100)->getCapacity(), 1 << 20);
    const uint8_t* stock = manager->getBlock(kSize)->getData();
    const P<IMemoryBlock> block = read(kSize, kSize);
    EXPECT_EQ(block->getData(), stock);
    EXPECT_EQ(std::count(stock, stock + block->getSize(), 'x'), kSize);
    EXPECT_EQ(read(kSize, kSize)->getSize(), kSize); // nothing in stock
}

TEST(MemoryManager, IsSafeFromAnyThread) {
    const P<CMemoryManager> manager = make<CMemoryManager>(4);
    std::atomic<int> faults = 0;
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&, t] {
            std::mt19937 random(static_cast<unsigned>(t));
            for (int i = 0; i < 5000; ++i) {
                const P<IMemoryBlock> block = manager->getBlock(1 + random() % 300);
                std::memset(block->getData(), t, static_cast<size_t>(block->getSize()));
                for (int64_t k = 0; k < block->getSize(); ++k) faults += block->getData()[k] != t;
            }
        });
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(faults, 0);
}

TEST(BufferedIOStream, ReturnsBytesInOrderAcrossBlocks) {
    const P<CMemoryManager> manager = make<CMemoryManager>();
    const P<CBufferedIOStream> stream = make<CBufferedIOStream>(manager);
    std::mt19937 random(3);
    uint8_t next = 0, expected = 0;
    for (int i = 0; i < 2000; ++i) {
        uint8_t bytes[300];
        const int64_t size = static_cast<int64_t>(random() % sizeof bytes);
        if (random() % 2) {
            for (int64_t k = 0; k < size; ++k) bytes[k] = next++;
            stream->write(bytes, size);
        } else {
            const int64_t available = stream->getAvailable();
            ASSERT_EQ(stream->isAtEnd(), available == 0);
            ASSERT_EQ(stream->readSome(bytes, size), std::min(size, available));
            for (int64_t k = 0; k < std::min(size, available); ++k) ASSERT_EQ(bytes[k], expected++);
        }
    }
}

TEST(BufferedIOStream, ShortReadTakesNothing) {
    const P<CBufferedIOStream> stream = make<CBufferedIOStream>(make<CMemoryManager>());
    char bytes[8];
    stream->write("abc", 3);
    EXPECT_THROW(stream->read(bytes, 4), CEndOfStreamError);
    EXPECT_THROW(stream->skip(4), CEndOfStreamError);
    stream->skip(1);
    EXPECT_EQ(stream->readSome(bytes, 8), 2);
    EXPECT_EQ(std::string(bytes, 2), "bc");
    EXPECT_EQ(stream->readSome(bytes, 8), 0);
    EXPECT_EQ(stream->getTotalWritten(), 3);
}

TEST(BufferedIOStream, SharesAppendedBlocksAndGivesThemBack) {
    const P<CMemoryManager> manager = make<CMemoryManager>();
    const P<CBufferedIOStream> stream = make<CBufferedIOStream>(manager);
    P<IMemoryBlock> block = manager->getBlock(4);
    std::memcpy(block->getData(), "1234", 4);
    stream->append(block);
    std::memcpy(block->getData(), "5678", 4); // seen by the reader: nothing was copied
    block = nullptr;
    EXPECT_EQ(manager->getCachedBytes(), 0);
    char bytes[4];
    stream->read(bytes, 4);
    EXPECT_EQ(std::string(bytes, 4), "5678");
    EXPECT_EQ(manager->getCachedBytes(), 64);
}

} // namespace
