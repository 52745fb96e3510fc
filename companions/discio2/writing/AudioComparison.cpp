#include "writing/AudioComparison.h"

#include <algorithm>
#include <cstring>
#include <optional>

namespace discio {

namespace {

constexpr int64_t kMaxShift = 2 * kFramesPerSector;
constexpr int32_t kBlocksAtOnce = kSectorsPerSecond;
constexpr int64_t kProbe = 64; // frames that have to be equal for a shift to be considered

// The frames of a track around the one that is compared. Those outside the track do not exist.
class CWindow {
public:
    CWindow(const IMedium& medium, const STrack& track)
        : m_track(track), m_reader(medium.createAudioReader(track)), m_next(track.start) {}

    // Makes the frames from `first` to `end` available, as far as the track has them.
    void provide(int64_t first, int64_t end) {
        if (const int64_t passed = std::min(first - m_first, getEnd() - m_first); passed > 0) {
            m_samples.erase(m_samples.begin(), m_samples.begin() + 2 * passed);
            m_first += passed;
        }
        while (getEnd() < end && m_next < m_track.end()) {
            const int32_t count = std::min(kBlocksAtOnce, m_track.end() - m_next);
            const size_t old = m_samples.size();
            m_samples.resize(old + static_cast<size_t>(count) * kAudioSectorBytes / 2);
            m_reader->read(m_next, count, m_samples.data() + old);
            m_next += count;
        }
    }
    int64_t getFirst() const { return m_first; }
    int64_t getEnd() const { return m_first + static_cast<int64_t>(m_samples.size() / 2); }
    const int16_t* at(int64_t frame) const { return m_samples.data() + 2 * (frame - m_first); }

private:
    STrack m_track;
    std::unique_ptr<IAudioReader> m_reader;
    int32_t m_next;
    int64_t m_first = 0;
    std::vector<int16_t> m_samples;
};

// Whether the written frames from `first` to `end` are the expected ones, `shift` frames later.
bool areEqual(const CWindow& expected, const CWindow& written, int64_t first, int64_t end, int64_t shift) {
    first = std::max({first, written.getFirst(), expected.getFirst() + shift});
    end = std::min({end, written.getEnd(), expected.getEnd() + shift});
    return first >= end || std::memcmp(written.at(first), expected.at(first - shift),
                                       static_cast<size_t>(end - first) * 2 * sizeof(int16_t)) == 0;
}

// The smallest shift that explains a portion; nothing if it is silent, so that any would do.
std::optional<int64_t> findShift(const CWindow& expected, const CWindow& written, int64_t first,
                                 int64_t end) {
    const int16_t* const from = written.at(first);
    const int16_t* const to = written.at(end - 1) + 2;
    const int16_t* const sound = std::find_if(from, to, [](int16_t sample) { return sample != 0; });
    const int64_t probe = first + (sound - from) / 2;
    if (probe + kProbe > end) return std::nullopt;
    for (int64_t distance = 0; distance <= kMaxShift; ++distance)
        for (const int64_t shift : {distance, -distance})
            if (probe - shift >= expected.getFirst() && probe + kProbe - shift <= expected.getEnd() &&
                areEqual(expected, written, probe, probe + kProbe, shift) &&
                areEqual(expected, written, first, end, shift))
                return shift;
    return kMaxShift + 1;
}

void compareTrack(const IMedium& expected, const IMedium& written, size_t index,
                  std::optional<int64_t>& shift, const std::string& name, const CProgress& progress) {
    const STrack& track = expected.getContents().tracks[index];
    CWindow own(expected, track), other(written, written.getContents().tracks[index]);
    const int64_t frames = int64_t{track.length} * kFramesPerSector;
    constexpr int64_t kStep = int64_t{kBlocksAtOnce} * kFramesPerSector;
    for (int64_t first = 0; first < frames; first += kStep) {
        const int64_t end = std::min(first + kStep, frames);
        // Until the shift is known, what it may have moved over the end is left to the next portion.
        constexpr int64_t kMargin = kMaxShift + kProbe;
        const int64_t ahead = shift ? end : std::min(end + kMargin, frames);
        own.provide(std::max<int64_t>(first - kMaxShift, 0), ahead + kMaxShift);
        other.provide(first, ahead);
        if (!shift) shift = findShift(own, other, first, ahead);
        const int64_t compared = shift ? end : std::min(end, ahead - kMargin);
        if (!areEqual(own, other, first, compared, shift.value_or(0)) ||
            std::abs(shift.value_or(0)) > kMaxShift)
            throw CDiscError(DISCIO_ERROR_DEVICE, name + ": track " + std::to_string(track.number) +
                                                      " differs from what was written");
        progress.report(DISCIO_PHASE_VERIFY, track.start + end / kFramesPerSector,
                        expected.getContents().leadOut);
    }
}

} // namespace

void compareAudio(const IMedium& expected, const IMedium& written, const std::string& name,
                  const CProgress& progress) {
    const auto &own = expected.getContents().tracks, &other = written.getContents().tracks;
    const bool isSame = std::equal(
        own.begin(), own.end(), other.begin(), other.end(), [](const STrack& one, const STrack& two) {
            return two.isAudio && one.start == two.start && one.length <= two.length;
        });
    if (!isSame) throw CDiscError(DISCIO_ERROR_DEVICE, name + ": the tracks are not where they were written");
    std::optional<int64_t> shift;
    for (size_t i = 0; i < own.size(); ++i) compareTrack(expected, written, i, shift, name, progress);
}

} // namespace discio
