// A drive that writes.
#pragma once

#include "writing/BurnLibrary.h"
#include "writing/FirstFailure.h"
#include "writing/Progress.h"

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>

namespace discio {

// The contents of a track. The library reads them on a thread of its own, at most until the burner is idle.
struct SFeed {
    // Fills as much of the memory as there is left; 0 at the end. Throws CDiscError.
    std::function<size_t(uint8_t* data, size_t size)> read;
    int64_t size = 0;
};

// The tracks of a session. Throws CDiscError.
class CBurnSession {
public:
    CBurnSession();
    ~CBurnSession();
    CBurnSession(const CBurnSession&) = delete;
    CBurnSession& operator=(const CBurnSession&) = delete;

    // `pregap` is silence before it, in blocks; for the first track the standard's own.
    void addAudioTrack(SFeed feed, int32_t pregap, const std::string& isrc);
    void addDataTrack(SFeed feed);

    burn::burn_disc* getDisc() const { return m_disc; }
    // The length of the tracks with their pregaps.
    int64_t getBlocks() const { return m_blocks; }
    // What the library has read of the tracks, from 0.0 to 1.0.
    double getFraction() const;
    const CFirstFailure& getFailure() const { return m_shared->failure; }

    struct SShared {
        CFirstFailure failure;
        std::atomic<int64_t> done = 0;
    };

private:
    burn::burn_track* addTrack(SFeed feed, int mode, int pad);

    const SBurnLibrary& m_library;
    burn::burn_disc* m_disc;
    burn::burn_session* m_session;
    std::shared_ptr<SShared> m_shared = std::make_shared<SShared>();
    int64_t m_total = 0; // bytes
    int64_t m_blocks = 0;
    int m_tracks = 0;
};

struct SBurnSettings {
    bool isDummy = false;
    double speed = 0;      // 0: the fastest
    std::string textPacks; // CD-TEXT
    std::string catalogue; // 13 digits or empty
};

// Exclusive use of a drive. Only one exists in the process at a time; another thread waits for it.
class CBurner {
public:
    // Throws CDiscError.
    explicit CBurner(const std::string& device);
    ~CBurner();
    CBurner(const CBurner&) = delete;
    CBurner& operator=(const CBurner&) = delete;

    // Leaves a blank medium in the drive, which it blanks if `mayBlank` is set and the medium permits it, or
    // one that may be overwritten.
    void prepare(bool isAudio, bool mayBlank, const CProgress& progress);
    void blank(bool whole, const CProgress& progress);
    // Failures after the start of the write say that the medium is partly written.
    void write(const CBurnSession& session, bool isAudio, const SBurnSettings& settings,
               const CProgress& progress);

private:
    void grab();
    void release() noexcept;
    burn::burn_disc_status getMediumStatus() const;
    int getProfile() const;
    bool hasContent() const;
    void erase(bool whole, const CProgress& progress);
    // Calls `report` with the drive's state until it is idle.
    void wait(const std::function<void(burn::burn_drive_status, const burn::burn_progress&)>& report) const;
    void checkResult(const CBurnSession& session, bool isCancelled) const;
    [[noreturn]] void fail(int32_t code, const std::string& reason) const;

    const SBurnLibrary& m_library;
    std::unique_lock<std::mutex> m_lock;
    std::string m_device;
    burn::burn_drive_info* m_drives = nullptr;
    burn::burn_drive* m_drive = nullptr;
};

} // namespace discio
