#include "freedb/FreeDBDiscInfo.h"

#include "peru/Errors.h"

#include <limits>

namespace freedb {

namespace {

uint32_t sumDigits(int32_t number) {
    uint32_t sum = 0;
    for (; number > 0; number /= 10) sum += static_cast<uint32_t>(number % 10);
    return sum;
}

} // namespace

CFreeDBDiscInfo::CFreeDBDiscInfo(std::vector<STrack> tracks) : m_tracks(std::move(tracks)) {
    const auto require = [](bool condition) {
        if (!condition) throw peru::CInvalidArgError("tracks", "CFreeDBDiscInfo");
    };
    require(!m_tracks.empty() && m_tracks.size() <= kMostTracks);
    int64_t last = -1;
    for (const STrack& track : m_tracks) {
        const int64_t offset = int64_t{track.start} + (m_offsets.empty() ? track.pregap : kPregap);
        require(offset > last && offset <= std::numeric_limits<int32_t>::max());
        m_offsets.push_back(static_cast<int32_t>(offset));
        last = offset;
    }
    const int64_t end = last + m_tracks.back().length;
    require(end > last && end <= std::numeric_limits<int32_t>::max());
    m_end = static_cast<int32_t>(end);
}

CFreeDBDiscInfo::~CFreeDBDiscInfo() = default;

P<CFreeDBDiscInfo> CFreeDBDiscInfo::fromOffsets(const std::vector<int32_t>& offsets, int32_t leadOut) {
    std::vector<STrack> tracks;
    for (size_t i = 0; i < offsets.size(); ++i) {
        const int64_t next = i + 1 < offsets.size() ? offsets[i + 1] : leadOut;
        const int64_t length = next - offsets[i];
        if (offsets[i] < 0 || length <= 0 || length > std::numeric_limits<int32_t>::max())
            throw peru::CInvalidArgError("offsets", "CFreeDBDiscInfo::fromOffsets");
        tracks.push_back({offsets[i] - kPregap, static_cast<int32_t>(length), kPregap});
    }
    return peru::make<CFreeDBDiscInfo>(std::move(tracks));
}

int32_t CFreeDBDiscInfo::getTotalSeconds() const {
    return (m_end - m_offsets.front()) / kFramesPerSecond;
}

uint32_t CFreeDBDiscInfo::getDiscId() const {
    uint32_t sum = 0;
    for (const int32_t offset : m_offsets) sum += sumDigits(offset / kFramesPerSecond);
    // Whole seconds of each end, which may differ from the whole seconds between them.
    const int32_t seconds = m_end / kFramesPerSecond - m_offsets.front() / kFramesPerSecond;
    return (sum % 255) << 24 | static_cast<uint32_t>(seconds) << 8 | static_cast<uint32_t>(m_tracks.size());
}

} // namespace freedb
