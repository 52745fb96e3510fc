#include "writing/DiscWriter.h"
#include "drives/DeviceMedium.h"
#include "writing/AudioComparison.h"
#include "writing/Burner.h"
#include "writing/CdTextPacks.h"
#include "writing/IsoSource.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <scsi/sg.h>
#include <sys/ioctl.h>
#include <system_error>
#include <unistd.h>
#include <zlib.h>

namespace discio {

namespace {

constexpr int32_t kBlocksAtOnce = kSectorsPerSecond;
constexpr int32_t kShortestTrack = 4 * kSectorsPerSecond; // the standard of audio CDs
// Drives read ahead over the end of a data track, and may fail there.
constexpr uint32_t kTailBlocks = 150;
constexpr uint16_t kReadBlocks = 16; // every drive and driver accepts 32 kB

// The samples of a track as the drive wants them: whole sectors, little-endian.
class CTrackFeed {
public:
    CTrackFeed(const IMedium& medium, const STrack& track) : m_medium(medium), m_track(track) {}

    size_t read(uint8_t* data, size_t size) {
        if (m_used == m_buffer.size()) fill();
        const size_t count = std::min(size, m_buffer.size() - m_used);
        std::memcpy(data, m_buffer.data() + m_used, count);
        m_used += count;
        return count;
    }

private:
    void fill() {
        if (!m_reader) m_reader = m_medium.createAudioReader(m_track);
        const int32_t count = std::min(kBlocksAtOnce, m_track.length - m_done);
        std::vector<int16_t> samples(static_cast<size_t>(count) * kAudioSectorBytes / 2);
        if (count > 0) m_reader->read(m_track.start + m_done, count, samples.data());
        m_buffer.resize(samples.size() * 2);
        for (size_t i = 0; i < samples.size(); ++i) {
            const auto value = static_cast<uint16_t>(samples[i]);
            m_buffer[2 * i] = static_cast<uint8_t>(value);
            m_buffer[2 * i + 1] = static_cast<uint8_t>(value >> 8);
        }
        m_used = 0;
        m_done += count;
        if (m_done == m_track.length) m_reader.reset(); // closes the source on this thread
    }

    const IMedium& m_medium;
    STrack m_track;
    std::unique_ptr<IAudioReader> m_reader;
    int32_t m_done = 0;
    std::vector<uint8_t> m_buffer;
    size_t m_used = 0;
};

SBurnSettings toBurnSettings(const SDiscSettings& settings) {
    SBurnSettings own;
    own.isDummy = settings.isDummy;
    own.speed = settings.speed;
    return own;
}

// Reads data from the drive by commands: the kernel may still have the size of the blank medium.
class CDeviceReader {
public:
    explicit CDeviceReader(const std::string& device)
        : m_device(device), m_file(::open(device.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC)) {
        if (m_file < 0) fail(std::generic_category().message(errno));
    }
    ~CDeviceReader() { ::close(m_file); }
    CDeviceReader(const CDeviceReader&) = delete;
    CDeviceReader& operator=(const CDeviceReader&) = delete;

    void read(uint32_t block, uint16_t count, uint8_t* data) const {
        uint8_t command[10] = {kRead10};
        for (int i = 0; i < 4; ++i) command[2 + i] = static_cast<uint8_t>(block >> (24 - 8 * i));
        command[7] = static_cast<uint8_t>(count >> 8);
        command[8] = static_cast<uint8_t>(count);
        uint8_t sense[32] = {};
        sg_io_hdr_t header{};
        header.interface_id = 'S';
        header.dxfer_direction = SG_DXFER_FROM_DEV;
        header.cmd_len = sizeof command;
        header.cmdp = command;
        header.mx_sb_len = sizeof sense;
        header.sbp = sense;
        header.dxfer_len = count * kDataSectorBytes;
        header.dxferp = data;
        header.timeout = 60'000; // milliseconds
        if (::ioctl(m_file, SG_IO, &header) != 0) fail(std::generic_category().message(errno));
        if (header.status != 0 || header.host_status != 0)
            fail("block " + std::to_string(block) + " cannot be read");
    }

private:
    static constexpr uint8_t kRead10 = 0x28;

    [[noreturn]] void fail(const std::string& reason) const {
        throw CDiscError(DISCIO_ERROR_DEVICE, m_device + " cannot be read back: " + reason);
    }

    std::string m_device;
    int m_file;
};

// The sum of the first blocks on a data disc.
uLong readSum(const std::string& device, int64_t blocks, const CProgress& progress) {
    const CDeviceReader reader(device);
    std::vector<uint8_t> portion(size_t{kReadBlocks} * kDataSectorBytes);
    uLong sum = 0;
    for (int64_t done = 0; done < blocks;) {
        const auto count = static_cast<uint16_t>(std::min<int64_t>(kReadBlocks, blocks - done));
        reader.read(static_cast<uint32_t>(done), count, portion.data());
        sum = crc32(sum, portion.data(), static_cast<uInt>(count) * kDataSectorBytes);
        done += count;
        progress.report(DISCIO_PHASE_VERIFY, done, blocks);
    }
    return sum;
}

} // namespace

void writeAudioDisc(const CVirtualAudioDisc& disc, const std::string& device, const SDiscSettings& settings,
                    const CProgress& progress) {
    if (disc.getSegments().empty()) throw CDiscError(DISCIO_ERROR_DISC_EMPTY, "the project has no tracks");
    progress.report(DISCIO_PHASE_PREPARE, 0.0);
    const STableOfContents& contents = disc.getContents();
    SBurnSettings burnSettings = toBurnSettings(settings);
    if (settings.withTexts) burnSettings.textPacks = makeTextPacks(contents);
    burnSettings.catalogue = contents.texts[DISCIO_TEXT_CODE];
    for (const STrack& track : contents.tracks)
        if (track.length < kShortestTrack)
            throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED,
                             "track " + std::to_string(track.number) +
                                 " is shorter than 4 seconds, the least on an audio CD");
    {
        CBurner burner(device);
        burner.prepare(true, settings.mayBlank, progress);
        CBurnSession session;
        for (const STrack& track : contents.tracks) {
            const auto feed = std::make_shared<CTrackFeed>(disc, track);
            session.addAudioTrack({[feed](uint8_t* data, size_t size) { return feed->read(data, size); },
                                   int64_t{track.length} * kAudioSectorBytes},
                                  track.pregap, track.texts[DISCIO_TEXT_CODE]);
        }
        burner.write(session, true, burnSettings, progress);
    }
    if (settings.isVerified && !settings.isDummy)
        compareAudio(disc, *openDeviceMedium(device), device, progress);
}

void writeDataDisc(const CVirtualDataDisc& disc, const std::string& device, const SDiscSettings& settings,
                   const CProgress& progress) {
    progress.report(DISCIO_PHASE_PREPARE, 0.0);
    const auto source = std::make_shared<CIsoSource>(disc, kTailBlocks);
    const auto sum = std::make_shared<uLong>(0); // read after the library's thread has ended
    {
        CBurner burner(device);
        burner.prepare(false, settings.mayBlank, progress);
        CBurnSession session;
        session.addDataTrack({[source, sum](uint8_t* data, size_t size) {
                                  const size_t count = source->read(data, size);
                                  *sum = crc32(*sum, data, static_cast<uInt>(count));
                                  return count;
                              },
                              source->getSize()});
        burner.write(session, false, toBurnSettings(settings), progress);
    }
    if (settings.isVerified && !settings.isDummy &&
        readSum(device, source->getSize() / kDataSectorBytes, progress) != *sum)
        throw CDiscError(DISCIO_ERROR_DEVICE, device + ": the disc differs from what was written");
}

void blankDisc(const std::string& device, bool whole, const CProgress& progress) {
    CBurner(device).blank(whole, progress);
}

} // namespace discio
