// The objects behind the handles, and the barrier of the exported functions.
#pragma once

#include "Medium.h"
#include "PcmStream.h"
#include "Text.h"
#include "data/DataVolume.h"
#include "drives/Drives.h"
#include "projects/VirtualDisc.h"

#include <map>
#include <mutex>
#include <optional>

namespace discio {

enum class EKind : uint32_t {
    library = 0x4C434944, // spells "DICL" and so on in memory
    drive = 0x44434944,
    disc = 0x53434944,
    stream = 0x50434944,
    cursor = 0x43434944,
    project = 0x4A434944,
    released = 0,
};

// Every handle starts with its kind. The others stay valid after the release of those they came from.
struct SHandle {
    uint32_t kind;
};

// Texts that were returned last, by the function that returned them.
class CReturnedTexts {
public:
    const char16_t* hold(const void* function, std::string_view utf8) {
        return (m_texts[function] = toUTF16(utf8)).c_str();
    }

private:
    std::map<const void*, std::u16string> m_texts;
};

struct SDisc {
    std::shared_ptr<IMedium> medium;
    std::mutex mutex; // guards the volume
    std::shared_ptr<IDataVolume> volume;

    // The audio tracks. These throw CDiscError.
    int32_t countSegments() const;
    const STrack& requireSegment(int32_t segment) const;
    IDataVolume& getVolume();
};

} // namespace discio

struct DISCIO_Library : discio::SHandle {
    std::string image; // empty for the drives of the machine
    std::optional<discio::Drives> drives;
};
struct DISCIO_Drive : discio::SHandle {
    std::shared_ptr<discio::IDrive> drive;
    discio::CReturnedTexts texts;
    std::vector<double> speeds;
};
struct DISCIO_Disc : discio::SHandle {
    std::shared_ptr<discio::SDisc> disc;
    discio::CReturnedTexts texts;
};
struct DISCIO_DataCursor : discio::SHandle {
    std::shared_ptr<discio::SDisc> disc;
    discio::DataPath stored;
    std::string path; // shown, with "\" at its end
    std::vector<discio::SDataEntry> entries;
    size_t next = 0;
    discio::CReturnedTexts texts;
};
struct DISCIO_Project : discio::SHandle {
    std::shared_ptr<discio::CVirtualDisc> disc;
};

namespace discio {

// The streams of the library, as opposed to those from a host's functions, share these. Their user data is an
// IPcmStream.
extern const DISCIO_PCMAudioStreamFuncs kStreamFuncs;

struct SStreamHandle : DISCIO_PCMAudioStream {
    // A null record stands for the library's own.
    explicit SStreamHandle(std::shared_ptr<IPcmStream> shared,
                           const DISCIO_PCMAudioStreamFuncs* functions = nullptr, void* data = nullptr)
        : DISCIO_PCMAudioStream{static_cast<uint32_t>(EKind::stream), functions ? functions : &kStreamFuncs,
                                functions ? data : shared.get()},
          stream(std::move(shared)) {}
    std::shared_ptr<IPcmStream> stream;
};

// Records a failure for DISCIO_GetLastError.
void setLastError(int32_t code, const char* detail) noexcept;
void recordException() noexcept; // within a catch clause

template <class R, class Body> R barrier(const R& failure, Body&& body) {
    try {
        return static_cast<R>(body());
    } catch (...) {
        recordException();
    }
    return failure;
}

// Throws CDiscError for null and for handles of another kind.
template <class T> T& require(T* handle, EKind kind) {
    if (!handle || reinterpret_cast<const SHandle*>(handle)->kind != static_cast<uint32_t>(kind))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return *handle;
}
inline DISCIO_Library& require(DISCIO_Library* handle) {
    return require(handle, EKind::library);
}
inline DISCIO_Drive& require(DISCIO_Drive* handle) {
    return require(handle, EKind::drive);
}
inline DISCIO_Disc& require(DISCIO_Disc* handle) {
    return require(handle, EKind::disc);
}
inline DISCIO_Project& require(DISCIO_Project* handle) {
    return require(handle, EKind::project);
}
inline DISCIO_DataCursor& require(DISCIO_DataCursor* handle) {
    return require(handle, EKind::cursor);
}

template <class T> T* makeHandle(EKind kind) {
    T* handle = new T;
    handle->kind = static_cast<uint32_t>(kind);
    return handle;
}

void releaseStream(DISCIO_PCMAudioStream* stream);

} // namespace discio
