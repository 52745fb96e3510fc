// The kinds of discs.
#pragma once

#include "disciopp/IDrive.h"

#include <mutex>

namespace disciopp {

class CDiscBase : public CBase, public virtual IDisc {
public:
    DISCIO_Disc* getHandle() override { return m_handle.get(); }
    int32_t getMediumType() override { return DISCIO_DiscGetMediumType(m_handle.get()); }
    bool isEmpty() override { return DISCIO_DiscIsEmpty(m_handle.get()) == 1; }
    bool isErasable() override { return DISCIO_DiscIsErasable(m_handle.get()) == 1; }
    bool isVirtual() override { return DISCIO_DiscIsVirtual(m_handle.get()) == 1; }
    bool isWritable() override { return DISCIO_DiscIsWritable(m_handle.get()) == 1; }
    int64_t getCapacityBytes() override { return DISCIO_DiscGetCapacityBytes(m_handle.get()); }
    double getFreeSpaceFraction() override { return DISCIO_DiscGetFreeSpaceFraction(m_handle.get()); }
    P<peru::IString> getDisplayName() override; // "(drive) title"

protected:
    // `root` is the URI of the drive's root folder.
    CDiscBase(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root);
    ~CDiscBase() override;

    const Handle<DISCIO_Disc> m_handle;
    const P<peru::IURI> m_root;
    std::mutex m_mutex; // held while a text of the handle is copied, which the next call replaces
};

class CDataDisc : public CDiscBase {
public:
    CDataDisc(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root) : CDiscBase(std::move(handle), root) {}
    P<peru::IString> getTitle() override;
    P<IFileSystem> getFileSystem() override;
};

class CAudioCDDisc : public CDiscBase, public IAudioCDDisc {
public:
    CAudioCDDisc(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root)
        : CDiscBase(std::move(handle), root) {}
    P<peru::IString> getTitle() override;
    P<IFileSystem> getFileSystem() override;
    int32_t getSegmentCount() override;
    P<peru::IString> getText(int32_t segment, int32_t text) override;
    Handle<DISCIO_PCMAudioStream> createStream(int32_t segment) override;
};

class CEmptyDisc : public CDiscBase {
public:
    CEmptyDisc(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root) : CDiscBase(std::move(handle), root) {}
    P<peru::IString> getTitle() override;
    P<IFileSystem> getFileSystem() override;
};

// A singleton of the global object factory.
class DISCIOPP_API CDiscFactory : public CBase {
public:
    static P<CDiscFactory> get();

    // A disc with data and audio is a data disc. Empty for a null handle and for a disc with nothing on it
    // that is not blank either.
    P<IDisc> create(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root);

private:
    CDiscFactory() = default;
    ~CDiscFactory() override;
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);
};

} // namespace disciopp
