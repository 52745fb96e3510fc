// Pooled memory blocks.
#pragma once

#include "peru/ISerializable.h"
#include "peru/Object.h"
#include "peru/threads/IMutex.h"

#include <array>

namespace peru {

// A growable byte block with size and capacity. The size is the count of valid bytes.
class PERU_API IMemoryBlock : public virtual IBase, public virtual ISerializable {
public:
    virtual uint8_t* getData() = 0; // aligned to 64 bytes; changes when the block grows
    virtual const uint8_t* getData() const = 0;
    virtual int64_t getSize() const = 0;
    virtual int64_t getCapacity() const = 0;
    // Keeps the existing bytes and grows the capacity if needed. New bytes are not initialised.
    virtual void setSize(int64_t size) = 0;
};

// Returns blocks by size and reuses released ones. Thread-safe.
class PERU_API IMemoryManager : public virtual IBase {
public:
    // Returns a block of that size with at least that capacity; its bytes are not initialised.
    virtual P<IMemoryBlock> getBlock(int64_t size) = 0;
};

class PERU_API CMemoryBlockBase : public CObject, public IMemoryBlock {
public:
    ~CMemoryBlockBase() override;
    uint8_t* getData() override { return m_data; }
    const uint8_t* getData() const override { return m_data; }
    int64_t getSize() const override { return m_size; }
    int64_t getCapacity() const override { return m_capacity; }
    void setSize(int64_t size) override;
    // The size as int32, then the bytes. Writing throws CInvalidArgError if the size does not fit. Reading
    // allocates memory only as the bytes arrive, whatever size the stream announces.
    void writeTo(const P<IDataOutStream>& stream) const override;
    void readFrom(const P<IDataInStream>& stream) override;

protected:
    explicit CMemoryBlockBase(int64_t capacity);
    // Called before a read of that many bytes, of which perhaps none arrive: may enlarge the capacity of the
    // empty block by memory that is in stock, but allocates none.
    virtual void prepareRead(int64_t) {}

    uint8_t* m_data = nullptr;
    int64_t m_size = 0;
    int64_t m_capacity = 0;
};

// A block outside any pool.
class PERU_API CMemoryBlock : public CMemoryBlockBase {
public:
    explicit CMemoryBlock(int64_t size = 0);
};

class CMemoryManager;

// A block that returns to its manager's free list on its last release.
class PERU_API CCachedMemoryBlock : public CMemoryBlockBase {
public:
    ~CCachedMemoryBlock() override;
    void destroy() override;

protected:
    void prepareRead(int64_t size) override;

private:
    friend class CMemoryManager;
    CCachedMemoryBlock(const P<CMemoryManager>& manager, int64_t capacity);

    P<CMemoryManager> m_manager;          // set while the block is in use, empty while it is in the free list
    CCachedMemoryBlock* m_next = nullptr; // in the free list
};

class PERU_API CMemoryManager : public CObject, public IMemoryManager {
public:
    // Keeps at most `cachedBlocks` released blocks of each size class.
    explicit CMemoryManager(int cachedBlocks = 30);
    ~CMemoryManager() override;
    P<IMemoryBlock> getBlock(int64_t size) override;
    int64_t getCachedBytes() const; // in the free lists

private:
    friend class CCachedMemoryBlock;
    static int64_t getClassCapacity(int64_t size);
    CCachedMemoryBlock* takeFree(int64_t size);
    void takeBack(CCachedMemoryBlock* block);

    // Powers of two from 64 bytes to 16 MiB. Larger blocks are rare and go back to the system.
    static constexpr int64_t kSmallestBlock = 64;
    static constexpr int kSizeClasses = 19;
    static constexpr int64_t kLargestCachedBlock = kSmallestBlock << (kSizeClasses - 1);

    struct SFreeList {
        CCachedMemoryBlock* first =
            nullptr; // most recently released first, since its bytes are likely in the CPU cache
        int count = 0;
    };

    int m_cachedBlocks;
    P<IMutex> m_mutex; // guards the free lists; nothing is allocated or freed under it
    std::array<SFreeList, kSizeClasses> m_free;
};

} // namespace peru
