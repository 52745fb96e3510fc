#include "drives/DeviceMedium.h"
#include "CdText.h"

#include <algorithm>
#include <cdio/cdio.h>
#include <cdio/logging.h>
#include <cdio/mmc.h>
#include <cdio/mmc_ll_cmds.h>
#include <cdio/paranoia/cdda.h>
#include <cdio/paranoia/paranoia.h>
#include <cstring>
#include <utility>

namespace discio {

namespace {

using Device = std::unique_ptr<CdIo_t, void (*)(CdIo_t*)>;

constexpr int kMaxRetries = 20; // of one sector

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
        const lsn_t pregap = cdio_get_track_pregap_lsn(device, id);
        const int32_t end = contents.tracks.empty() ? -kLeadInSectors : contents.tracks.back().start + 1;
        track.pregap = number == first ? track.start + kLeadInSectors
                       : pregap != CDIO_INVALID_LSN && pregap >= end && pregap < track.start
                           ? track.start - pregap
                           : 0;
        if (track.isAudio)
            if (char* code = cdio_get_track_isrc(device, id)) {
                track.texts[DISCIO_TEXT_CODE] = code;
                cdio_free(code);
            }
        contents.tracks.push_back(track);
    }
    contents.leadOut = cdio_get_track_lsn(device, CDIO_CDROM_LEADOUT_TRACK);
    for (size_t i = 0; i < contents.tracks.size(); ++i) {
        const bool isLast = i + 1 == contents.tracks.size();
        STrack& track = contents.tracks[i];
        const int32_t end =
            isLast ? contents.leadOut : contents.tracks[i + 1].start - contents.tracks[i + 1].pregap;
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

// The callback of the reader has no user data.
thread_local int64_t t_repairs = 0;
thread_local int64_t t_skipped = 0;

void onRead(long, paranoia_cb_mode_t mode) {
    switch (mode) {
    case PARANOIA_CB_FIXUP_EDGE:
    case PARANOIA_CB_FIXUP_ATOM:
    case PARANOIA_CB_FIXUP_DROPPED:
    case PARANOIA_CB_FIXUP_DUPED:
    case PARANOIA_CB_REPAIR:
    case PARANOIA_CB_READERR:
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
        m_drive->bigendianp = 0; // as READ CD delivers; the library's guess from the sound errs with noise
        m_paranoia.reset(cdio_paranoia_init(m_drive.get()));
        cdio_paranoia_modeset(m_paranoia.get(), PARANOIA_MODE_FULL ^ PARANOIA_MODE_NEVERSKIP);
        cdio_paranoia_set_range(m_paranoia.get(), track.start, track.end() - 1);
    }

    void read(int32_t block, int32_t count, int16_t* samples) override {
        if (cdio_get_media_changed(m_device.get()) == 1) throwLost();
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
    [[noreturn]] void throwLost() const {
        throw CDiscError(DISCIO_ERROR_DISC_LOST, "the disc in " + m_path + " has been exchanged");
    }
    [[noreturn]] void throwUnreadable(int32_t block) const {
        if (cdio_get_media_changed(m_device.get()) == 1) throwLost();
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
    std::string getDataPath() const override { return m_path; }

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
