#include "discio2/FakeDisc.h"

#include <algorithm>
#include <cstdint>
#include <random>
#include <unistd.h>

namespace tests {

SFakeDisc& fakeDisc() {
    static SFakeDisc s_disc;
    return s_disc;
}

namespace {

constexpr int kSectorBytes = 2352;

// One descriptor of a table of contents; track 0xAA is the lead-out.
std::string describeTrack(int number, int block, bool isData) {
    return std::string(1, '\0') + (isData ? '\x14' : '\x10') + static_cast<char>(number) + '\0' +
           toBig(static_cast<unsigned>(block), 4);
}

char toBcd(size_t value) {
    return static_cast<char>(value / 10 << 4 | value % 10);
}

// The formatted Q subchannel. Some blocks have the catalogue number there instead of the position.
std::string describePlace(const SFakeDisc& disc, int block) {
    size_t track = 0;
    int index = 1;
    for (size_t i = 0; i + 1 < disc.starts.size(); ++i) {
        const int pregap = i < disc.pregaps.size() ? disc.pregaps[i] : 0;
        if (block < disc.starts[i] - pregap) continue;
        track = i + 1;
        index = block >= disc.starts[i];
    }
    const bool isPosition = block % 97 != 5;
    return (isPosition ? std::string("\x01") + toBcd(track) + static_cast<char>(index)
                       : std::string("\x02\x12\x01")) +
           std::string(13, '\0');
}

bool readSectors(int block, int blocks, std::string& reply) {
    SFakeDisc& disc = fakeDisc();
    if (block < 0 || block + blocks > disc.starts.back()) return false;
    if (disc.readsUntilOpened == 0) disc.isPresent = false;
    if (disc.readsUntilOpened >= 0 && disc.readsUntilOpened-- == 0) return false;
    if (disc.badBlock >= block && disc.badBlock < block + blocks) return false;
    for (auto& [bad, times] : disc.failures)
        if (times > 0 && bad >= block && bad < block + blocks) return --times, false;
    if (disc.readMicroseconds > 0) ::usleep(static_cast<useconds_t>(disc.readMicroseconds));
    int64_t place = int64_t{block} * kSectorBytes;
    const int64_t size = int64_t{blocks} * kSectorBytes;
    if (disc.jitter > 0 && blocks > 1) {
        static std::minstd_rand s_random(1);
        const int shift =
            static_cast<int>(s_random() % (2 * static_cast<unsigned>(disc.jitter))) - disc.jitter;
        if (s_random() % 3 == 0) place += shift * 4;
        place = std::clamp<int64_t>(place, 0, static_cast<int64_t>(disc.samples.size()) - size);
    }
    reply = disc.samples.substr(static_cast<size_t>(place), static_cast<size_t>(size));
    return true;
}

} // namespace

std::string toBig(unsigned value, int bytes) {
    std::string text;
    for (int i = bytes; i-- > 0;) text += static_cast<char>(value >> 8 * i);
    return text;
}

std::string makeTextPacks(const std::vector<std::string>& titles) {
    std::string packs;
    unsigned count = 0;
    const auto add = [&](char type, size_t track, size_t position, std::string text) {
        text.resize(12);
        packs += std::string{type, static_cast<char>(track), static_cast<char>(count++),
                             static_cast<char>(std::min<size_t>(position, 15))} +
                 text;
        unsigned crc = 0;
        for (const char c : packs.substr(packs.size() - 16)) {
            crc ^= static_cast<unsigned>(static_cast<unsigned char>(c)) << 8;
            for (int bit = 0; bit < 8; ++bit) crc = (crc << 1 ^ (crc & 0x8000 ? 0x1021 : 0)) & 0xFFFF;
        }
        packs += toBig(~crc & 0xFFFF, 2);
    };
    std::string all;
    std::vector<std::pair<size_t, size_t>> places; // the track of each character, and the place in its title
    for (size_t i = 0; i < titles.size(); ++i)
        for (size_t k = 0; k <= titles[i].size(); ++k) {
            all += k < titles[i].size() ? titles[i][k] : '\0';
            places.emplace_back(i, k);
        }
    for (size_t i = 0; i < all.size(); i += 12)
        add('\x80', places[i].first, places[i].second, all.substr(i, 12));
    std::string sizes(36, '\0');
    sizes[1] = 1;
    sizes[2] = static_cast<char>(titles.size() - 1);
    sizes[4] = static_cast<char>(count);
    sizes[4 + 15] = 3;
    sizes[20] = static_cast<char>(count + 2);
    sizes[28] = 9; // English
    for (size_t i = 0; i < 3; ++i) add('\x8F', i, 0, sizes.substr(i * 12, 12));
    return packs;
}

bool answer(const unsigned char* command, std::string& reply) {
    SFakeDisc& disc = fakeDisc();
    const size_t count = disc.starts.empty() ? 0 : disc.starts.size() - 1;
    switch (command[0]) {
    case 0x46: // GET CONFIGURATION: the profile of a pressed or a recordable CD
        reply = toBig(4, 4) + std::string(2, '\0') +
                toBig(static_cast<unsigned>(disc.profile   ? disc.profile
                                            : disc.isBlank ? 9
                                                           : 8),
                      2);
        return true;
    case 0x51: // READ DISC INFORMATION
        reply = toBig(32, 2) + (disc.isBlank ? '\0' : '\2') + std::string(29, '\0');
        reply[21] = 79;
        reply[22] = 59;
        reply[23] = 74;
        return true;
    case 0x42: // READ SUB-CHANNEL: the code of a track
        if (command[3] != 3 || disc.code.empty()) return false;
        reply = std::string("\0\0\0\x14\3\x14", 6) + static_cast<char>(command[6]) + '\0' + '\x80' +
                disc.code + std::string(3, '\0');
        return true;
    case 0x43: { // READ TOC
        const int format = command[2] & 0xF ? command[2] & 0xF : command[9] >> 6;
        if (disc.isBlank) return false;
        if (format == 5 && disc.textPacks.empty()) return false;
        std::string list;
        if (format == 5) list = disc.textPacks;
        if (format == 0)
            for (size_t i = 0; i <= count; ++i)
                list += describeTrack(i < count ? static_cast<int>(i) + 1 : 0xAA, disc.starts[i],
                                      disc.dataTracks.contains(i));
        reply = toBig(static_cast<unsigned>(list.size()) + 2, 2) + std::string("\1") +
                static_cast<char>(count) + list;
        return format == 0 || format == 5;
    }
    case 0xBE: { // READ CD
        const int block = command[2] << 24 | command[3] << 16 | command[4] << 8 | command[5];
        const int blocks = command[6] << 16 | command[7] << 8 | command[8];
        if ((command[10] & 7) == 0) return readSectors(block, blocks, reply);
        ++disc.subchannelReads;
        if ((command[10] & 7) != 2 || blocks != 1 || command[9] != 0xF8) return false;
        reply = std::string(kSectorBytes, '\0') + describePlace(disc, block);
        return true;
    }
    case 0x12: // INQUIRY
        reply.assign("\5\x80\2\2\x1f\0\0\0", 8).append("ACME    Disc reader     1.00");
        return true;
    default:
        return false;
    }
}

} // namespace tests
