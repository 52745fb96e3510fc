#include "drives/DeviceAudioReader.h"

#include "drives/CdioDevice.h"
#include "drives/DeviceStatus.h"

#include <algorithm>
#include <array>
#include <cdio/paranoia/cdda.h>
#include <cdio/paranoia/paranoia.h>
#include <cerrno>
#include <cstring>
#include <deque>
#include <linux/cdrom.h>
#include <utility>

namespace discio {

namespace {

constexpr int kMaxRetries = 20; // of one sector whose samples are in doubt
constexpr int kMaxReads = 8;    // of sectors that the drive cannot read, or that differ each time
constexpr int kMaxStarts = 16;  // until the library has found the right place
// Sectors that are read apart from the library's work to check it.
constexpr size_t kWindow = 3;
constexpr int32_t kTail = 4;
constexpr int kSilence = 2;        // sectors without a change, after which the place is in doubt again
constexpr int32_t kLookAhead = 75; // sectors in which a sound is looked for
// Sectors behind a track that are read to find its sound, and to confirm its end.
constexpr int32_t kOverlap = kLookAhead + static_cast<int32_t>(kWindow);

// Whether another medium has the same tracks in the same places.
bool areSame(const STableOfContents& one, const STableOfContents& other) {
    return one.leadOut == other.leadOut &&
           std::equal(
               one.tracks.begin(), one.tracks.end(), other.tracks.begin(), other.tracks.end(),
               [](const STrack& a, const STrack& b) { return a.start == b.start && a.isAudio == b.isAudio; });
}

// The end of the audio that follows a track without an interruption.
int32_t findSoundEnd(const STableOfContents& contents, const STrack& track) {
    int32_t end = track.end();
    for (const STrack& each : contents.tracks)
        if (each.isAudio && each.number > track.number && each.start - each.pregap == end) end = each.end();
    return end;
}

class CDeviceAudioReader;

// The library's callbacks have no user data.
thread_local CDeviceAudioReader* t_reader = nullptr;
thread_local int64_t t_repairs = 0;
thread_local int64_t t_skipped = 0;

void onRead(long, paranoia_cb_mode_t mode) {
    switch (mode) {
    case PARANOIA_CB_FIXUP_EDGE:
    case PARANOIA_CB_FIXUP_ATOM:
    case PARANOIA_CB_FIXUP_DROPPED:
    case PARANOIA_CB_FIXUP_DUPED:
    case PARANOIA_CB_REPAIR:
        ++t_repairs;
        break;
    case PARANOIA_CB_SKIP:
        ++t_skipped;
        break;
    default:
        break;
    }
}

// The library joins reads that overlap, wherever the drive began them. That leaves two faults of drives
// that do not find their place exactly, and both are mended here: the first read decides where everything
// is, and after silence, where nothing can be compared, so does the next one; and at the end of the sound,
// with nothing behind it to overlap, the library fills up with zeros. So the first sectors with sound and
// the last ones are read again until two reads agree.
class CDeviceAudioReader : public IAudioReader {
public:
    CDeviceAudioReader(const std::string& path, const STableOfContents& contents, const STrack& track)
        : m_path(path), m_track(track), m_end(findSoundEnd(contents, track)), m_device(openCdioDevice(path)) {
        cdio_get_media_changed(m_device.get()); // reports from now on
        if (STableOfContents now = readTrackPlaces(); !areSame(now, contents)) throwLost();
        m_drive.reset(cdio_cddap_identify_cdio(m_device.get(), CDDA_MESSAGE_FORGETIT, nullptr));
        if (!m_drive || cdio_cddap_open(m_drive.get()) != 0)
            throw CDiscError(DISCIO_ERROR_DEVICE, path + " cannot read audio");
        m_drive->read_audio = [](cdrom_drive_t*, void* to, lsn_t block, long count) {
            return t_reader->readSectors(to, block, count);
        };
        m_drive->bigendianp = 0; // as READ CD delivers; the library's guess from the sound errs with noise
    }

    void read(int32_t block, int32_t count, int16_t* samples) override {
        if (checkLost(false)) throwLost();
        t_reader = this;
        if (block != m_next) {
            m_next = block;
            start();
        }
        for (int32_t i = 0; i < count; ++i, ++m_next) {
            if (m_pending.empty()) fill();
            std::memcpy(samples + static_cast<size_t>(i) * kSectorSamples, m_pending.front().data(),
                        kAudioSectorBytes);
            m_pending.pop_front();
        }
    }
    int64_t getRepairs() const override { return m_repairs; }

private:
    static constexpr size_t kSectorSamples = kAudioSectorBytes / 2;
    using Sector = std::array<int16_t, kSectorSamples>;
    using Sectors = std::vector<Sector>;

    struct SCloseDrive {
        void operator()(cdrom_drive_t* drive) const { cdio_cddap_close_no_free_cdio(drive); }
    };
    struct SFreeParanoia {
        void operator()(cdrom_paranoia_t* paranoia) const { cdio_paranoia_free(paranoia); }
    };

    STableOfContents readTrackPlaces() const {
        STableOfContents contents;
        const track_t first = cdio_get_first_track_num(m_device.get());
        const track_t last = cdio_get_last_track_num(m_device.get());
        if (first == CDIO_INVALID_TRACK) return contents;
        for (int number = first; number <= last; ++number) {
            STrack track;
            track.start = cdio_get_track_lsn(m_device.get(), static_cast<track_t>(number));
            track.isAudio =
                cdio_get_track_format(m_device.get(), static_cast<track_t>(number)) == TRACK_FORMAT_AUDIO;
            contents.tracks.push_back(track);
        }
        contents.leadOut = cdio_get_track_lsn(m_device.get(), CDIO_CDROM_LEADOUT_TRACK);
        return contents;
    }

    // Forgets what has been read, and continues at the next sector.
    void start() {
        m_pending.clear();
        m_isPlaced = false;
        m_paranoia.reset(cdio_paranoia_init(m_drive.get()));
        cdio_paranoia_modeset(m_paranoia.get(), PARANOIA_MODE_FULL ^ PARANOIA_MODE_NEVERSKIP);
        cdio_paranoia_set_range(m_paranoia.get(), m_track.start - m_track.getReadablePregap(),
                                std::min(m_track.end() + kOverlap, m_end) - 1);
        if (cdio_paranoia_seek(m_paranoia.get(), m_next, SEEK_SET) < 0) throwUnreadable(m_next);
    }
    int32_t getPulled() const { return m_next + static_cast<int32_t>(m_pending.size()); }

    void pull() {
        t_repairs = t_skipped = 0;
        const int16_t* sector = cdio_paranoia_read_limited(m_paranoia.get(), onRead, kMaxRetries);
        m_repairs += std::exchange(t_repairs, 0);
        if (!sector || t_skipped > 0) throwUnreadable(getPulled());
        std::memcpy(m_pending.emplace_back().data(), sector, kAudioSectorBytes);
    }

    static bool isSilent(const Sector& sector) {
        return std::memcmp(sector.data(), sector.data() + 2, kAudioSectorBytes - 4) == 0;
    }

    void fill() {
        if (m_next >= m_end - kTail) return fillTail();
        if (m_isPlaced) {
            pull();
            m_silent = isSilent(m_pending.back()) ? m_silent + 1 : 0;
            m_isPlaced = m_silent < kSilence;
            return;
        }
        for (int starts = 1;; ++starts) {
            const int32_t end = m_end - kTail;
            do pull();
            while (isSilent(m_pending.back()) && getPulled() < std::min(m_next + kLookAhead, end));
            if (isSilent(m_pending.back())) return;
            const size_t sound = m_pending.size() - 1;
            while (m_pending.size() < sound + kWindow && getPulled() < end) pull();
            const Sectors window(m_pending.begin() + static_cast<std::ptrdiff_t>(sound), m_pending.end());
            const int32_t block = m_next + static_cast<int32_t>(sound);
            if (agree(block, window) == window) break;
            if (starts == kMaxStarts) throwUnreadable(block);
            ++m_repairs;
            start();
        }
        m_isPlaced = true;
        m_silent = 0;
    }

    void fillTail() {
        while (getPulled() < m_end) pull();
        const Sectors own(m_pending.begin(), m_pending.end());
        const Sectors agreed = agree(m_next, own);
        if (agreed == own) return;
        ++m_repairs;
        m_pending.assign(agreed.begin(), agreed.end());
    }

    // What two reads agree on, of which one may be that of the library; its own if there is no such pair.
    Sectors agree(int32_t block, const Sectors& own) {
        std::vector<Sectors> seen{own};
        for (int i = 0; i < kMaxReads; ++i) {
            // The drive would deliver the same bytes again from its cache.
            Sector ignored;
            const int32_t first = m_track.start;
            cdio_read_audio_sectors(m_device.get(), ignored.data(),
                                    block - first > m_end - block ? first : m_end - 1, 1);
            Sectors now(own.size());
            if (cdio_read_audio_sectors(m_device.get(), now.data(), block,
                                        static_cast<uint32_t>(now.size())) != DRIVER_OP_SUCCESS) {
                ++m_repairs;
                if (checkLost(true)) throwLost();
                continue;
            }
            if (std::find(seen.begin(), seen.end(), now) != seen.end()) return now;
            seen.push_back(std::move(now));
        }
        return own;
    }

    // Instead of the library's function: counts the failures, and ends at once when the disc has gone. A
    // drive that gets another disc fails once, and reads that one from then on.
    long readSectors(void* to, lsn_t block, long count) {
        if (!to) { // moves the head, so that the drive forgets what it has read ahead
            std::array<int16_t, kAudioSectorBytes / 2> ignored;
            return cdio_read_audio_sectors(m_device.get(), ignored.data(), block, 1) == DRIVER_OP_SUCCESS;
        }
        count = std::min<long>(count, m_drive->nsectors);
        for (int tries = 0; tries < kMaxReads;) {
            if (cdio_read_audio_sectors(m_device.get(), to, block, static_cast<uint32_t>(count)) ==
                DRIVER_OP_SUCCESS)
                return count;
            ++t_repairs;
            if (checkLost(true)) {
                errno = ENOMEDIUM;
                return -1;
            }
            if (count == 1) ++tries;
            count = std::max(count / 2, 1L);
        }
        m_unreadable = block;
        errno = EIO;
        return -1;
    }
    // The drive reports a change only once. Asks it only after a failure whether there is a disc at all.
    // Called by C code.
    bool checkLost(bool afterFailure) noexcept {
        if (cdio_get_media_changed(m_device.get()) == 1) m_isLost = true;
        if (afterFailure && !m_isLost) {
            try {
                const int status = getDeviceStatus(m_path);
                m_isLost = status == CDS_NO_DISC || status == CDS_TRAY_OPEN;
            } catch (const std::exception&) {
                m_isLost = true; // the drive itself has gone
            }
        }
        return m_isLost;
    }
    [[noreturn]] void throwLost() const {
        throw CDiscError(DISCIO_ERROR_DISC_LOST,
                         "the disc in " + m_path + " has been taken out or exchanged");
    }
    [[noreturn]] void throwUnreadable(int32_t block) {
        m_next = -1; // the next read starts anew
        if (checkLost(true)) throwLost();
        if (m_unreadable >= 0) block = std::exchange(m_unreadable, -1);
        throw CDiscError(DISCIO_ERROR_DEVICE, m_path + ": block " + std::to_string(block) + " of track " +
                                                  std::to_string(m_track.number) + " cannot be read");
    }

    std::string m_path;
    STrack m_track;
    int32_t m_end; // of the sound that can be read
    CdioDevice m_device;
    std::unique_ptr<cdrom_drive_t, SCloseDrive> m_drive;
    std::unique_ptr<cdrom_paranoia_t, SFreeParanoia> m_paranoia;
    int32_t m_next = -1;          // to be delivered
    std::deque<Sector> m_pending; // from there on
    bool m_isPlaced = false;      // what the library delivers is where it belongs
    int m_silent = 0;             // sectors delivered in a row
    int64_t m_repairs = 0;
    bool m_isLost = false;
    int32_t m_unreadable = -1; // the block that the drive could not read; usually ahead of the position
};

} // namespace

std::unique_ptr<IAudioReader> createDeviceAudioReader(const std::string& path,
                                                      const STableOfContents& contents, const STrack& track) {
    return std::make_unique<CDeviceAudioReader>(path, contents, track);
}

} // namespace discio
