#include "drives/DeviceMedium.h"
#include "CdText.h"
#include "drives/CdioDevice.h"
#include "drives/DeviceAudioReader.h"
#include "drives/DeviceStatus.h"
#include "drives/Pregaps.h"

#include <algorithm>
#include <array>
#include <cdio/cdio.h>
#include <cdio/mmc.h>
#include <cdio/mmc_ll_cmds.h>
#include <cerrno>
#include <cstring>
#include <unistd.h>
#include <utility>

namespace discio {

namespace {

// Between two sessions: lead-out, lead-in and pregap.
constexpr int32_t kSessionGap = 6750 + 4500 + 150;

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
        const int64_t blocks = int64_t{minutes * 60 + seconds} * kSectorsPerSecond + frames - kLeadInSectors;
        if (state.isEmpty && minutes < 0xFF && blocks > 0) // neither is set for other media than CDs
            state.capacityBytes = blocks * kDataSectorBytes;
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
    contents.lastSession = session;
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

// The kernel counts the blocks of all sessions.
class CDeviceDataReader : public IDataReader {
public:
    explicit CDeviceDataReader(const std::string& path) : m_path(path), m_device(path) {}

    void read(int32_t block, int32_t count, void* to) override {
        auto* at = static_cast<char*>(to);
        int64_t left = int64_t{count} * kDataSectorBytes;
        for (int64_t offset = int64_t{block} * kDataSectorBytes; left > 0;) {
            const ssize_t some = ::pread(m_device.get(), at, static_cast<size_t>(left), offset);
            if (some < 0 && errno == EINTR) continue;
            if (some <= 0)
                throw CDiscError(DISCIO_ERROR_READ_INPUT, m_path + ": block " +
                                                              std::to_string(offset / kDataSectorBytes) +
                                                              " cannot be read");
            at += some;
            offset += some;
            left -= some;
        }
    }
    std::string getName() const override { return m_path; }

private:
    std::string m_path;
    CDeviceDescriptor m_device;
};

class CDeviceMedium : public IMedium {
public:
    explicit CDeviceMedium(const std::string& path) : m_path(path) {
        const CdioDevice device = openCdioDevice(path);
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
        return createDeviceAudioReader(m_path, m_contents, track);
    }
    std::string getDataPath() const override {
        const STrack* track = findDataTrack();
        return track && track->start == 0 ? m_path : std::string();
    }
    std::unique_ptr<IDataReader> createDataReader() const override {
        return std::make_unique<CDeviceDataReader>(m_path);
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
