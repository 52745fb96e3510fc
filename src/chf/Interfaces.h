// The interfaces of chunk files, with an interface root of their own: the format does not depend on the
// object model. A chunk file with all its streams belongs to one thread at a time.
#pragma once

#include "zvr_lang_manager/Api.h"

#include <cstdint>
#include <utility>

namespace chf {

// Counted from 1; the last Release deletes the object.
class ZVR_LANG_API IInterface {
public:
    virtual void AddRef() = 0;
    virtual void Release() = 0;

protected:
    virtual ~IInterface() = default;
};

class ZVR_LANG_API IStream : public virtual IInterface {
public:
    virtual int64_t GetPosition() = 0;
    virtual int64_t GetSize() = 0;
    virtual void Seek(int64_t position) = 0; // from the start
    virtual void Write(const void* buffer, uint32_t count) = 0;
    // Returns the number of bytes read, which is less than `count` only at the end of the file.
    virtual uint32_t Read(void* buffer, uint32_t count) = 0;
    // Both act at the current position, which does not change, and move the rest of the file: see
    // CBaseStream.
    virtual void InsertSpace(int64_t count) = 0;
    virtual void RemoveSpace(int64_t count) = 0;
};

// Learns of space that was inserted into the file or removed from it. `origin` is the listener that reports
// the change, or null when a parent passes the news down; `position` is an offset in the underlying stream.
class ZVR_LANG_API IChunkSpaceListener : public virtual IInterface {
public:
    virtual void OnSpaceInserted(IChunkSpaceListener* origin, int64_t position, int64_t count) = 0;
    virtual void OnSpaceRemoved(IChunkSpaceListener* origin, int64_t position, int64_t count) = 0;
};

class CChunkStream;

// Opens streams on its chunks.
class ZVR_LANG_API IChunkHolder : public virtual IChunkSpaceListener {
public:
    virtual void ChildClosed(CChunkStream* child) = 0;
};

// A strong handle. The constructor adopts the reference of a new object.
template <class T> class TRef {
public:
    TRef() = default;
    explicit TRef(T* adopted) : m_object(adopted) {}
    TRef(const TRef& other) : m_object(other.m_object) {
        if (m_object) m_object->AddRef();
    }
    TRef(TRef&& other) noexcept : m_object(std::exchange(other.m_object, nullptr)) {}
    template <class U> TRef(const TRef<U>& other) : m_object(other.get()) {
        if (m_object) m_object->AddRef();
    }
    ~TRef() {
        if (m_object) m_object->Release();
    }
    TRef& operator=(TRef other) noexcept {
        std::swap(m_object, other.m_object);
        return *this;
    }
    static TRef Share(T* object) {
        if (object) object->AddRef();
        return TRef(object);
    }

    T* get() const { return m_object; }
    T* operator->() const { return m_object; }
    T& operator*() const { return *m_object; }
    explicit operator bool() const { return m_object != nullptr; }

private:
    T* m_object = nullptr;
};

} // namespace chf
