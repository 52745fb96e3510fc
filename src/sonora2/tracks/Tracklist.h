// The logic of a time line: which tracks play when, and when they are opened and closed.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ILogManager.h"
#include "sonora2/tracks/ITracklist.h"
#include "sonora2/tracks/TrackOpener.h"

#include <memory>
#include <vector>

namespace sonora2::common {

// Tracks are grouped into lanes, one per sort index; within a lane one track plays at a time, in order of
// start. A track is open while it plays; with openInThread it is opened up to kLookAheadSeconds earlier. One
// thread may play while others send commands.
class SONORA2_API CTracklist : public peru::CObject, public virtual ITracklist {
public:
    static constexpr double kLookAheadSeconds = 5.0;

    ~CTracklist() override;

    void addTrack(const P<ITrack>& track, double start, double end) override;
    double getDuration() override;
    uint32_t getCurrentFrame() override;
    int getBufferStatus() override;
    void processCommand(const P<ITrackCommand>& command) override;
    void skipToFrame(uint32_t frame) override;
    bool hasMore() override;
    bool step() override;
    P<peru::IXmlDocument> getDebugDocument() override;

protected:
    enum class EState : uint8_t { closed, requested, playing };

    struct SEntry {
        uint32_t start; // frames of the list, both inclusive
        uint32_t end;
        P<ITrack> track;
        EState state = EState::closed; // as far as the list is concerned
    };
    using Entries = std::vector<SEntry*>;

    // A frame of the list lasts framerateNum / framerateDen seconds; `fixedDuration` is the start of the list
    // on the time line of skip commands. The log may be empty.
    CTracklist(int framerateNum, int framerateDen, int sortIndex, bool openInThread, double fixedDuration,
               const P<ILogManager>& log);

    // All called with the lock held.
    virtual void mix(const Entries& active) = 0;
    virtual int64_t getPositionMs() = 0;
    virtual void setPosition(double time) = 0; // after a skip; seconds from the list's start
    // Closes all open tracks and returns to the start.
    void closeTracks();

    int getListSortIndex() const { return m_sortIndex; }
    double getFixedDuration() const { return m_fixedDuration; }
    const P<peru::IMutex>& getLock() const { return m_lock; }

private:
    struct SLane {
        int sortIndex;
        size_t cursor = 0; // the first entry that has not ended
        // Copied from the entry at the cursor, so that a step over thousands of lanes touches nothing else.
        uint32_t start;
        uint32_t end;
        std::vector<std::unique_ptr<SEntry>> entries; // by start

        bool isDone() const { return cursor >= entries.size(); }
        SEntry& current() const { return *entries[cursor]; }
        void moveTo(size_t index);
    };

    uint32_t toFrame(double seconds) const;
    double toSeconds(uint32_t frame) const;
    uint32_t getFrameOfPosition();
    void skipTo(double time);
    void findActive();
    void openActive();
    void lookAhead();
    double getLookAheadEnd() const;
    void leave(SEntry& entry);
    void describe(const P<peru::IXmlNode>& node, const SEntry& entry, int sortIndex) const;
    void closeEntry(SEntry& entry) noexcept;

    int m_framerateNum;
    int m_framerateDen;
    int m_sortIndex;
    bool m_openInThread;
    double m_fixedDuration;
    P<ILogManager> m_log;

    P<peru::IMutex> m_lock; // guards everything below; taken before the opener's and the tracks' own
    uint32_t m_maxFrame = 0;
    uint32_t m_currentFrame = 0;
    std::vector<SLane> m_lanes; // by sort index
    Entries m_active;           // tracks playing at the current frame, in lane order
    Entries m_held;             // entries whose state is not `closed`
    P<CTrackOpener> m_opener;
};

} // namespace sonora2::common
