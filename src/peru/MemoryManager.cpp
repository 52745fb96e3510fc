#include "peru/MemoryManager.h"

#include "peru/Errors.h"
#include "peru/uri/IURI.h"

#include <algorithm>
#include <bit>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <new>
#include <utility>

namespace peru {

namespace {

constexpr int64_t kAlignment = 64;

int64_t roundUp(int64_t size) {
    if (size > std::numeric_limits<int64_t>::max() - kAlignment) throw std::bad_alloc();
    return std::max((size + kAlignment - 1) / kAlignment * kAlignment, kAlignment);
}

uint8_t* allocate(int64_t capacity) {
    void* data = std::aligned_alloc(kAlignment, static_cast<size_t>(capacity));
    if (!data) throw std::bad_alloc();
    return static_cast<uint8_t*>(data);
}

} // namespace

CMemoryBlockBase::CMemoryBlockBase(int64_t capacity) {
    if (capacity < 0) throw CInvalidArgError("capacity", "CMemoryBlockBase::CMemoryBlockBase");
    m_capacity = roundUp(capacity);
    m_data = allocate(m_capacity);
}

CMemoryBlockBase::~CMemoryBlockBase() {
    std::free(m_data);
}

void CMemoryBlockBase::setSize(int64_t size) {
    if (size < 0) throw CInvalidArgError("size", "CMemoryBlockBase::setSize");
    if (size > m_capacity) {
        const int64_t doubled = m_capacity > std::numeric_limits<int64_t>::max() / 2 ? size : m_capacity * 2;
        const int64_t capacity = roundUp(std::max(size, doubled));
        uint8_t* data = allocate(capacity);
        if (m_size > 0) std::memcpy(data, m_data, static_cast<size_t>(m_size));
        std::free(m_data);
        m_data = data;
        m_capacity = capacity;
    }
    m_size = size;
}

void CMemoryBlockBase::writeTo(const P<IDataOutStream>& stream) const {
    if (m_size > std::numeric_limits<int32_t>::max())
        throw CInvalidArgError("size", "CMemoryBlockBase::writeTo");
    stream->writeInt32(static_cast<int32_t>(m_size));
    stream->write(m_data, m_size);
}

void CMemoryBlockBase::readFrom(const P<IDataInStream>& stream) {
    constexpr int64_t kStep = 64 * 1024;
    const int64_t size = stream->readInt32();
    if (size < 0) throw CEndOfStreamError(stream->getURI());
    setSize(0);
    prepareRead(size);
    while (m_size < size) {
        const int64_t done = m_size;
        const int64_t step = std::min(size - done, std::max({done, kStep, m_capacity - done}));
        setSize(done + step);
        stream->read(m_data + done, step);
    }
}

CMemoryBlock::CMemoryBlock(int64_t size) : CMemoryBlockBase(size) {
    m_size = size;
}

CCachedMemoryBlock::CCachedMemoryBlock(const P<CMemoryManager>& manager, int64_t capacity)
    : CMemoryBlockBase(capacity), m_manager(manager) {}

CCachedMemoryBlock::~CCachedMemoryBlock() = default;

void CCachedMemoryBlock::destroy() {
    // A block in the free list must not keep its manager alive. Releasing this handle may destroy the
    // manager, and the block with it, so the block must not be touched after takeBack.
    if (const P<CMemoryManager> manager = std::move(m_manager))
        manager->takeBack(this);
    else
        CMemoryBlockBase::destroy();
}

// A block of unknown size is created small. Growing it while it is read would copy what has arrived again and
// again, into memory that is new to the processor.
void CCachedMemoryBlock::prepareRead(int64_t size) {
    if (size <= m_capacity) return;
    CCachedMemoryBlock* const larger = m_manager->takeFree(size);
    if (!larger) return;
    std::swap(m_data, larger->m_data);
    std::swap(m_capacity, larger->m_capacity);
    m_manager->takeBack(larger);
}

CMemoryManager::CMemoryManager(int cachedBlocks)
    : m_cachedBlocks(cachedBlocks), m_mutex(getMutexFactory()->createMutex()) {}

CMemoryManager::~CMemoryManager() {
    for (SFreeList& list : m_free)
        while (CCachedMemoryBlock* block = list.first) {
            list.first = block->m_next;
            block->destroy();
        }
}

int64_t CMemoryManager::getClassCapacity(int64_t size) {
    return static_cast<int64_t>(std::bit_ceil(static_cast<uint64_t>(std::max(size, kSmallestBlock))));
}

P<IMemoryBlock> CMemoryManager::getBlock(int64_t size) {
    if (size < 0) throw CInvalidArgError("size", "CMemoryManager::getBlock");
    if (size > kLargestCachedBlock) return make<CMemoryBlock>(size);

    const P<CMemoryManager> self = P<CMemoryManager>::share(this);
    CCachedMemoryBlock* block = takeFree(size);
    if (block) {
        block->resetCount();
        block->m_manager = self;
    } else {
        block = new CCachedMemoryBlock(self, getClassCapacity(size));
    }
    P<IMemoryBlock> result(block);
    result->setSize(size);
    return result;
}

// Null if the free lists have no block of that class.
CCachedMemoryBlock* CMemoryManager::takeFree(int64_t size) {
    if (size > kLargestCachedBlock) return nullptr;
    const auto classes = static_cast<uint64_t>(getClassCapacity(size) / kSmallestBlock);
    SFreeList& list = m_free[static_cast<size_t>(std::countr_zero(classes))];
    const CMutexLock lock(m_mutex);
    CCachedMemoryBlock* const block = list.first;
    if (!block) return nullptr;
    list.first = std::exchange(block->m_next, nullptr);
    --list.count;
    return block;
}

void CMemoryManager::takeBack(CCachedMemoryBlock* block) {
    if (block->m_capacity <= kLargestCachedBlock) {
        // A block that has grown goes to the largest class that it can serve.
        const uint64_t classes = static_cast<uint64_t>(block->m_capacity / kSmallestBlock);
        SFreeList& list = m_free[static_cast<size_t>(std::bit_width(classes) - 1)];
        block->m_size = 0;
        CMutexLock lock(m_mutex);
        if (list.count < m_cachedBlocks) {
            block->m_next = list.first;
            list.first = block;
            ++list.count;
            return;
        }
    }
    block->destroy();
}

int64_t CMemoryManager::getCachedBytes() const {
    CMutexLock lock(m_mutex);
    int64_t bytes = 0;
    for (const SFreeList& list : m_free)
        for (const CCachedMemoryBlock* block = list.first; block; block = block->m_next)
            bytes += block->m_capacity;
    return bytes;
}

} // namespace peru
