// A disc's table of contents and its id.
#pragma once

#include "freedb/Api.h"
#include "peru/Object.h"

#include <cstdint>
#include <vector>

namespace freedb {

using peru::P;

// Immutable. Positions are in frames of 1/75 second.
class FREEDB_API CFreeDBDiscInfo : public peru::CObject {
public:
    static constexpr int32_t kFramesPerSecond = 75;
    static constexpr int32_t kPregap = 150;
    static constexpr size_t kMostTracks = 99;

    struct STrack {
        int32_t start = 0; // as a drive addresses it: the pre-gap is not counted
        int32_t length = 0;
        int32_t pregap = kPregap; // counts for the first track; all others have kPregap
    };

    // Throws CInvalidArgError unless there are 1 to 99 tracks whose offsets ascend from 0.
    explicit CFreeDBDiscInfo(std::vector<STrack> tracks);
    // From offsets that include the pre-gap, as CDDB states them ("150 17827 ..."), and that of the lead-out.
    static P<CFreeDBDiscInfo> fromOffsets(const std::vector<int32_t>& offsets, int32_t leadOut);
    ~CFreeDBDiscInfo() override;

    const std::vector<STrack>& getTracks() const { return m_tracks; }
    const std::vector<int32_t>& getOffsets() const { return m_offsets; } // one for each track
    int32_t getEnd() const { return m_end; }
    int32_t getTotalSeconds() const; // from the first track to the end
    uint32_t getDiscId() const;

private:
    std::vector<STrack> m_tracks;
    std::vector<int32_t> m_offsets;
    int32_t m_end = 0;
};

} // namespace freedb
