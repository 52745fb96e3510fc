// The library's functions, loaded at run time.
#pragma once

#include <tonewright/tonewright.h>

namespace host {

// Names of the exports without their prefix.
#define HOST_FUNCTIONS(X)                                                                                    \
    X(InitStartup)                                                                                           \
    X(DeInitAll)                                                                                             \
    X(SetDriveChangedCallback)                                                                               \
    X(SetTempExtension)                                                                                      \
    X(AddProxyLogManager)                                                                                    \
    X(RemoveProxyLogManager)                                                                                 \
    X(getValidCodecExtensions)                                                                               \
    X(getExtensionCount)                                                                                     \
    X(getExtension)                                                                                          \
    X(CreateAudioSourceFromEditorXml)                                                                        \
    X(AudioSource_GetDuration)                                                                               \
    X(AudioSource_FetchStreamSamples)                                                                        \
    X(CreateAudioSoureFromAudioInDevice)                                                                     \
    X(AudioSource_Open)                                                                                      \
    X(AudioSource_Close)                                                                                     \
    X(CreateAudioFormatFromURI)                                                                              \
    X(CreateAudioEncoder)                                                                                    \
    X(AudioEncoder_Encode)                                                                                   \
    X(CreatePlayerFromAudioSource)                                                                           \
    X(Player_Play)                                                                                           \
    X(Player_Pause)                                                                                          \
    X(Player_Stop)                                                                                           \
    X(CreateFileTag)                                                                                         \
    X(StoreFileTag)                                                                                          \
    X(FileTag_GetTitle)                                                                                      \
    X(FileTag_GetArtist)                                                                                     \
    X(FileTag_GetAlbum)                                                                                      \
    X(FileTag_GetAlbumArtist)                                                                                \
    X(FileTag_GetTrackNumber)                                                                                \
    X(FileTag_GetYear)                                                                                       \
    X(FileTag_GetGenre)                                                                                      \
    X(FileTag_GetComment)                                                                                    \
    X(FileTag_SetTitle)                                                                                      \
    X(FileTag_SetArtist)                                                                                     \
    X(FileTag_SetAlbum)                                                                                      \
    X(FileTag_SetAlbumArtist)                                                                                \
    X(FileTag_SetTrackNumber)                                                                                \
    X(FileTag_SetYear)                                                                                       \
    X(FileTag_SetGenre)                                                                                      \
    X(FileTag_SetComment)                                                                                    \
    X(AudioCDProject_AddTrackFromAudioSource)

// Only one object at a time.
class CLibrary {
public:
    // Loads $TONEWRIGHT_LIBRARY if that is set, otherwise the library with which this program was built or
    // installed. Throws std::runtime_error with the loader's reason.
    CLibrary();
    ~CLibrary(); // shuts the library down
    // Initialises the library; separate from loading, so that a log can be added before. Throws
    // std::runtime_error.
    void start();
    CLibrary(const CLibrary&) = delete;
    CLibrary& operator=(const CLibrary&) = delete;

#define HOST_DECLARE(name) decltype(&::TONEWRIGHT_##name) name = nullptr;
    HOST_FUNCTIONS(HOST_DECLARE)
#undef HOST_DECLARE

private:
    void* m_module = nullptr;
};

// Owns a handle.
class CHandle {
public:
    CHandle() = default;
    explicit CHandle(TONEWRIGHT_Handle handle) : m_handle(handle) {}
    CHandle(CHandle&& other) noexcept : m_handle(other.m_handle) { other.m_handle = nullptr; }
    CHandle& operator=(CHandle&& other) noexcept {
        TONEWRIGHT_Handle handle = other.m_handle;
        other.m_handle = nullptr;
        reset(handle);
        return *this;
    }
    ~CHandle() { reset(); }

    void reset(TONEWRIGHT_Handle handle = nullptr) {
        TONEWRIGHT_DestroyHandle(m_handle);
        m_handle = handle;
    }
    TONEWRIGHT_Handle get() const { return m_handle; }
    explicit operator bool() const { return m_handle != nullptr; }

private:
    TONEWRIGHT_Handle m_handle = nullptr;
};

} // namespace host
