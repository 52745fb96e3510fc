#include "drives/DeviceMedium.h"
#include "CdText.h"
#include "drives/DeviceStatus.h"
#include "drives/Pregaps.h"

#include <algorithm>
#include <array>
#include <cdio/cdio.h>
#include <cdio/logging.h>
#include <cdio/mmc.h>
#include <cdio/mmc_ll_cmds.h>
#include <cdio/paranoia/cdda.h>
#include <cdio/paranoia/paranoia.h>
#include <cerrno>
#include <cstring>
#include <linux/cdrom.h>
#include <utility>

namespace discio {

namespace {

using Device = std::unique_ptr<CdIo_t, void (*)(CdIo_t*)>;

constexpr int kMaxRetries = 20; // of one sector whose samples are in doubt
constexpr int kMaxReads = 8;    // of one sector that the drive cannot read
// Between two sessions: lead-out, lead-in and pregap.
constexpr int32_t kSessionGap = 6750 + 4500 + 150;

Device openDevice(const std::string& path) {
    cdio_log_set_handler([](cdio_log_level_t, const char*) {}); // it would print to standard output
    Device device(cdio_open(path.c_str(), DRIVER_LINUX), cdio_destroy);
    if (!device) throw CDiscError(DISCIO_ERROR_DEVICE, path + " cannot be opened");
    return device;
}

EMediumType toMediumType(uint16_t profile) {
    static constexpr std::pair<uint16_t, int> kProfiles[] = {
        {0x08, 1},  {0x09, 2},  {0x0A, 3},  {0x10, 4},  {0x12, 5},  {0x11, 6},
        {0x13, 7},  {0x14, 7},  {0x1B, 8},  {0x1A, 9},  {0x2B, 10}, {0x15, 11},
        {0x16, 11}, {0x40, 12}, {0x41, 13}, {0x42, 13}, {0x43, 14}};
    for (const auto& [number, type] : kProfiles)
        if (number == profile) return static_cast<EMediumType>(type);
    return EMediumType::unknown;
}

SMediumState readState(CdIo_t* device) {
    SMediumState state;
    uint8_t bytes[32] = {};
    mmc_cdb_t command = {};
    command.field[0] = 0x46; // GET CONFIGURATION: the header has the current profile
    command.field[1] = 2;
    command.field[8] = 8;
    if (mmc_run_cmd(device, 10000, &command, SCSI_MMC_DATA_READ, 8, bytes) == DRIVER_OP_SUCCESS)
        state.type = toMediumType(static_cast<uint16_t>(bytes[6] << 8 | bytes[7]));
    std::memset(bytes, 0, sizeof bytes);
    command = {};
    command.field[0] = 0x51; // READ DISC INFORMATION
    command.field[8] = sizeof bytes;
    if (mmc_run_cmd(device, 10000, &command, SCSI_MMC_DATA_READ, sizeof bytes, bytes) == DRIVER_OP_SUCCESS) {
        const int status = bytes[2] & 3; // 0 empty, 1 appendable, 2 complete
        state.isEmpty = status == 0;
        state.isErasable = bytes[2] & 0x10;
        state.isWritable = status != 2 || state.isErasable;
        const int minutes = bytes[21], seconds = bytes[22], frames = bytes[23];
        if (state.isEmpty && minutes < 0xFF)
            state.capacityBytes =
                (int64_t{minutes * 60 + seconds} * kSectorsPerSecond + frames - kLeadInSectors) *
                kDataSectorBytes;
        state.freeFraction = state.isEmpty ? 1.0 : 0.0;
    }
    return state;
}

std::optional<SBlockPlace> readPlace(CdIo_t* device, int32_t block) {
    std::array<uint8_t, kAudioSectorBytes + 16> bytes = {};
    constexpr uint8_t kAllHeaders = 3, kPosition = 2;
    if (mmc_read_cd(device, bytes.data(), block, 0, false, true, kAllHeaders, true, true, 0, kPosition,
                    bytes.size(), 1) != DRIVER_OP_SUCCESS)
        return std::nullopt;
    const uint8_t* position = bytes.data() + kAudioSectorBytes;
    if ((position[0] & 0xF) != 1) return std::nullopt;
    return SBlockPlace{position[1], position[2]};
}

// Sets the pregaps of audio tracks, unless the drive cannot read the subchannel. One block for each track
// is read where there are none.
void readPregaps(CdIo_t* device, std::vector<STrack>& tracks) {
    if (tracks.empty()) return;
    tracks[0].pregap = tracks[0].start + kLeadInSectors;
    for (size_t i = 1; i < tracks.size(); ++i) {
        if (!tracks[i].isAudio) continue;
        const std::optional<int32_t> pregap =
            findPregap(tracks[i].number, tracks[i].start, tracks[i - 1].start,
                       [&](int32_t block) { return readPlace(device, block); });
        if (!pregap) return;
        tracks[i].pregap = *pregap;
    }
}

STableOfContents readContents(CdIo_t* device) {
    STableOfContents contents;
    const track_t first = cdio_get_first_track_num(device), last = cdio_get_last_track_num(device);
    if (first == CDIO_INVALID_TRACK || last == CDIO_INVALID_TRACK || last < first) return contents;
    for (int number = first; number <= last; ++number) {
        const auto id = static_cast<track_t>(number);
        STrack track;
        track.number = number;
        track.isAudio = cdio_get_track_format(device, id) == TRACK_FORMAT_AUDIO;
        track.start = cdio_get_track_lsn(device, id);
        if (track.isAudio)
            if (char* code = cdio_get_track_isrc(device, id)) {
                track.texts[DISCIO_TEXT_CODE] = code;
                cdio_free(code);
            }
        contents.tracks.push_back(track);
    }
    readPregaps(device, contents.tracks);
    contents.leadOut = cdio_get_track_lsn(device, CDIO_CDROM_LEADOUT_TRACK);
    lsn_t session = 0; // start of the last one
    if (cdio_get_last_session(device, &session) != DRIVER_OP_SUCCESS) session = 0;
    for (size_t i = 0; i < contents.tracks.size(); ++i) {
        STrack& track = contents.tracks[i];
        int32_t end = contents.leadOut;
        if (i + 1 < contents.tracks.size()) {
            const STrack& next = contents.tracks[i + 1];
            end = next.start - next.pregap;
            if (next.start == session) end -= kSessionGap;
        }
        track.length = end - track.start;
    }
    if (char* code = cdio_get_mcn(device)) {
        contents.texts[DISCIO_TEXT_CODE] = code;
        cdio_free(code);
    }
    addCdText(cdio_get_cdtext(device), contents);
    return contents;
}

// Whether another medium has the same tracks in the same places.
bool areSame(const STableOfContents& one, const STableOfContents& other) {
    return one.leadOut == other.leadOut &&
           std::equal(
               one.tracks.begin(), one.tracks.end(), other.tracks.begin(), other.tracks.end(),
               [](const STrack& a, const STrack& b) { return a.start == b.start && a.isAudio == b.isAudio; });
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

class CDeviceAudioReader : public IAudioReader {
public:
    CDeviceAudioReader(const std::string& path, const STableOfContents& contents, const STrack& track)
        : m_path(path), m_track(track), m_device(openDevice(path)) {
        cdio_get_media_changed(m_device.get()); // reports from now on
        if (STableOfContents now = readTrackPlaces(); !areSame(now, contents)) throwLost();
        m_drive.reset(cdio_cddap_identify_cdio(m_device.get(), CDDA_MESSAGE_FORGETIT, nullptr));
        if (!m_drive || cdio_cddap_open(m_drive.get()) != 0)
            throw CDiscError(DISCIO_ERROR_DEVICE, path + " cannot read audio");
        m_drive->read_audio = [](cdrom_drive_t*, void* to, lsn_t block, long count) {
            return t_reader->readSectors(to, block, count);
        };
        m_drive->bigendianp = 0; // as READ CD delivers; the library's guess from the sound errs with noise
        m_paranoia.reset(cdio_paranoia_init(m_drive.get()));
        cdio_paranoia_modeset(m_paranoia.get(), PARANOIA_MODE_FULL ^ PARANOIA_MODE_NEVERSKIP);
        cdio_paranoia_set_range(m_paranoia.get(), track.start - track.getReadablePregap(), track.end() - 1);
    }

    void read(int32_t block, int32_t count, int16_t* samples) override {
        if (checkLost(false)) throwLost();
        t_reader = this;
        if (block != m_next) {
            if (cdio_paranoia_seek(m_paranoia.get(), block, SEEK_SET) < 0) throwUnreadable(block);
            m_next = block;
        }
        t_repairs = t_skipped = 0;
        for (int32_t i = 0; i < count; ++i, ++m_next) {
            const int16_t* sector = cdio_paranoia_read_limited(m_paranoia.get(), onRead, kMaxRetries);
            m_repairs += std::exchange(t_repairs, 0);
            if (!sector || t_skipped > 0) throwUnreadable(m_next);
            std::memcpy(samples + static_cast<size_t>(i) * kAudioSectorBytes / 2, sector, kAudioSectorBytes);
        }
    }
    int64_t getRepairs() const override { return m_repairs; }

private:
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
    bool checkLost(bool afterFailure) {
        if (cdio_get_media_changed(m_device.get()) == 1) m_isLost = true;
        if (afterFailure && !m_isLost) {
            const int status = getDeviceStatus(m_path);
            m_isLost = status == CDS_NO_DISC || status == CDS_TRAY_OPEN;
        }
        return m_isLost;
    }
    [[noreturn]] void throwLost() const {
        throw CDiscError(DISCIO_ERROR_DISC_LOST,
                         "the disc in " + m_path + " has been taken out or exchanged");
    }
    [[noreturn]] void throwUnreadable(int32_t block) {
        if (checkLost(true)) throwLost();
        if (m_unreadable >= 0) block = std::exchange(m_unreadable, -1);
        throw CDiscError(DISCIO_ERROR_DEVICE, m_path + ": block " + std::to_string(block) + " of track " +
                                                  std::to_string(m_track.number) + " cannot be read");
    }

    std::string m_path;
    STrack m_track;
    Device m_device;
    std::unique_ptr<cdrom_drive_t, SCloseDrive> m_drive;
    std::unique_ptr<cdrom_paranoia_t, SFreeParanoia> m_paranoia;
    int32_t m_next = -1;
    int64_t m_repairs = 0;
    bool m_isLost = false;
    int32_t m_unreadable = -1; // the block that the drive could not read; usually ahead of the position
};

class CDeviceMedium : public IMedium {
public:
    explicit CDeviceMedium(const std::string& path) : m_path(path) {
        const Device device = openDevice(path);
        m_state = readState(device.get());
        if (!m_state.isEmpty) m_contents = readContents(device.get());
        if (m_contents.tracks.empty() && !m_state.isEmpty)
            throw CDiscError(DISCIO_ERROR_NO_DISC, "there is no medium that can be read in " + path);
        if (m_state.capacityBytes == 0)
            m_state.capacityBytes = int64_t{m_contents.leadOut} * kDataSectorBytes;
    }

    const STableOfContents& getContents() const override { return m_contents; }
    SMediumState getState() const override { return m_state; }
    std::unique_ptr<IAudioReader> createAudioReader(const STrack& track) const override {
        return std::make_unique<CDeviceAudioReader>(m_path, m_contents, track);
    }
    // The library for file systems does not know about sessions.
    std::string getDataPath() const override {
        for (const STrack& track : m_contents.tracks)
            if (!track.isAudio && track.start != 0)
                throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED,
                                 m_path + ": the data track does not start at the beginning of the disc");
            else if (!track.isAudio)
                break;
        return m_path;
    }

private:
    std::string m_path;
    STableOfContents m_contents;
    SMediumState m_state;
};

} // namespace

std::shared_ptr<IMedium> openDeviceMedium(const std::string& path) {
    return std::make_shared<CDeviceMedium>(path);
}

} // namespace discio
