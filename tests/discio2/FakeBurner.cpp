#include "discio2/FakeBurner.h"

#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <scsi/sg.h>
#include <unistd.h>

namespace tests {

SFakeBurner& fakeBurner() {
    static SFakeBurner s_burner;
    return s_burner;
}

namespace {

constexpr gulong kGetIdLun = 0x5382, kGetBusNumber = 0x5386; // of the kernel's scsi.h
constexpr int kCapacity = 359844;                            // blocks of 80 minutes

int toInt(const unsigned char* bytes) {
    return bytes[0] << 24 | bytes[1] << 16 | bytes[2] << 8 | bytes[3];
}

// 24 bytes with 6 bits each make 18.
std::string joinSixBits(const std::string& bytes) {
    std::string joined;
    unsigned value = 0;
    int bits = 0;
    for (const char byte : bytes) {
        value = value << 6 | (static_cast<unsigned char>(byte) & 0x3F);
        bits += 6;
        if (bits < 8) continue;
        bits -= 8;
        joined += static_cast<char>(value >> bits & 0xFF);
    }
    return joined;
}

// An entry of the full table of contents; its time is that of a block.
std::string describePoint(int point, int block) {
    const int frames = block + 150;
    std::string entry("\1\x10\0\0\0\0\0\0", 8);
    entry[3] = static_cast<char>(point);
    return entry + static_cast<char>(frames / 4500) + static_cast<char>(frames / 75 % 60) +
           static_cast<char>(frames % 75);
}

// What was written becomes readable.
void finish() {
    SFakeBurner& burner = fakeBurner();
    SFakeDisc& disc = fakeDisc();
    if (burner.isDummy) burner.blocks.clear();
    if (burner.blocks.empty() || !disc.isBlank) return;
    disc.starts.clear();
    for (size_t i = 0; i + 8 <= burner.cueSheet.size(); i += 8) {
        const auto* entry = reinterpret_cast<const unsigned char*>(burner.cueSheet.data() + i);
        if (entry[1] > 0 && entry[2] == 1)
            disc.starts.push_back((entry[5] * 60 + entry[6]) * 75 + entry[7] - 150);
    }
    disc.samples.clear();
    for (const auto& [block, bytes] : burner.blocks)
        if (block >= 0) disc.samples += bytes;
    if (burner.offset > 0) // it is off by as much when it reads
        disc.samples.insert(0, static_cast<size_t>(burner.offset) * 4, '\0')
            .resize(static_cast<size_t>(disc.starts.back()) * 2352);
    // The packs repeat themselves in the lead-in. The first of a block has the sequence number 0.
    disc.textPacks = burner.leadIn;
    for (size_t i = 18; i + 18 <= burner.leadIn.size(); i += 18)
        if (burner.leadIn.compare(i, 18, burner.leadIn, 0, 18) == 0) {
            disc.textPacks = burner.leadIn.substr(0, i);
            break;
        }
    disc.isBlank = false;
}

bool write(const unsigned char* command, const std::string& data) {
    SFakeBurner& burner = fakeBurner();
    const int first = toInt(command + 2), count = command[7] << 8 | command[8];
    if (count == 0) return true;
    if (burner.writeMicroseconds > 0) ::usleep(static_cast<useconds_t>(burner.writeMicroseconds));
    const size_t size = data.size() / static_cast<size_t>(count);
    for (int i = 0; i < count; ++i) {
        const std::string bytes = data.substr(static_cast<size_t>(i) * size, size);
        if (first + i == burner.failsAt) return false;
        if (size == 96)
            burner.leadIn += joinSixBits(bytes);
        else
            burner.blocks[first + i] = bytes;
        if (first + i == burner.damagedAt) burner.blocks[first + i].back() ^= 1;
    }
    return true;
}

// The answer to a command; false if the drive refuses it. `data` is what the host sends.
bool answer(const unsigned char* command, const std::string& data, std::string& reply) {
    SFakeBurner& burner = fakeBurner();
    SFakeDisc& disc = fakeDisc();
    switch (command[0]) {
    case 0x00: // TEST UNIT READY
    case 0x1B: // START STOP UNIT
    case 0x1E: // PREVENT ALLOW MEDIUM REMOVAL
    case 0x54: // SEND OPC INFORMATION
    case 0x5B: // CLOSE TRACK SESSION
    case 0xB6: // SET STREAMING
        return true;
    case 0xBB: // SET CD SPEED
        burner.speed = command[4] << 8 | command[5];
        return true;
    case 0x03: // REQUEST SENSE
        reply = std::string("\x70", 1) + std::string(17, '\0');
        return true;
    case 0x12: // INQUIRY
        reply.assign("\5\x80\5\2\x1f\0\0\0", 8).append("ACME    Disc writer     1.00");
        return true;
    case 0x25: // READ CAPACITY
        reply = toBig(disc.isBlank ? 0 : static_cast<unsigned>(disc.starts.back()) - 1, 4) + toBig(2048, 4);
        return true;
    case 0x28: { // READ
        const size_t from = static_cast<size_t>(toInt(command + 2)) * 2048;
        const size_t size = static_cast<size_t>(command[7] << 8 | command[8]) * 2048;
        if (from + size > disc.samples.size()) return false;
        reply = disc.samples.substr(from, size);
        return true;
    }
    case 0x2A: // WRITE
        return write(command, data);
    case 0x35: // SYNCHRONIZE CACHE
        finish();
        return true;
    case 0x43: { // READ TOC/PMA/ATIP
        const int format = command[2] & 0xF;
        if (format == 4) {
            reply = toBig(26, 2) + std::string(26, '\0');
            reply[4] = '\x80';
            reply[6] = burner.isRewritable ? '\xC0' : '\x80';
            reply.replace(8, 3, {99, 50, 0});
            reply.replace(12, 3, {79, 59, 74});
        }
        if (format == 2 && !disc.isBlank) {
            const auto count = static_cast<int>(disc.starts.size()) - 1;
            std::string list = describePoint(0xA0, 4500 - 150) + describePoint(0xA1, count * 4500 - 150) +
                               describePoint(0xA2, disc.starts.back());
            for (int i = 0; i < count; ++i) list += describePoint(i + 1, disc.starts[static_cast<size_t>(i)]);
            reply = toBig(static_cast<unsigned>(list.size()) + 2, 2) + "\1\1" + list;
        }
        return !reply.empty();
    }
    case 0x46: { // GET CONFIGURATION
        const unsigned profile = burner.profile ? burner.profile : burner.isRewritable ? 0x0A : 0x09;
        const std::string features = toBig(0, 2) + "\3\4" + toBig(profile, 2) + std::string("\1\0", 2) +
                                     toBig(0x2E, 2) + std::string("\1\4\x6F\0\0\0", 6);
        reply = toBig(static_cast<unsigned>(features.size()) + 4, 4) + std::string(2, '\0') +
                toBig(profile, 2) + features;
        return true;
    }
    case 0x51: { // READ DISC INFORMATION
        reply = toBig(32, 2) + std::string(32, '\0');
        reply[2] = static_cast<char>((disc.isBlank ? 0 : 0x0E) | (burner.isRewritable ? 0x10 : 0));
        reply[3] = reply[4] = reply[5] = reply[6] = 1;
        reply[7] = burner.profile ? 3 : 0;  // has been formatted
        reply.replace(17, 3, {99, 50, 0});  // the lead-in starts there; a short one saves time
        reply.replace(21, 3, {79, 59, 74}); // the lead-out at the latest
        return true;
    }
    case 0x52: // READ TRACK INFORMATION
        reply.assign(36, '\0');
        reply.replace(1, 7, {34, 1, 1, 0, 4, 0x40, 1}); // blank, with a valid next writable address
        reply.replace(16, 4, toBig(kCapacity, 4));
        reply.replace(24, 4, toBig(kCapacity, 4));
        return true;
    case 0x55: // MODE SELECT: the write parameters
        burner.isDummy = data.size() > 10 && (data[10] & 0x10);
        return true;
    case 0x5A: { // MODE SENSE
        std::string page;
        if ((command[2] & 0x3F) == 0x2A) {
            page.assign(32, '\0');
            page.replace(0, 8, {0x2A, 30, 7, 7, 0x71, 0x63, 0x29, 3}); // reads and writes CD-R and CD-RW
            for (const size_t place : {8u, 14u, 18u, 20u}) page.replace(place, 2, toBig(7056, 2));
        } else {
            page = std::string("\5\x32", 2) + std::string(50, '\0');
        }
        reply = toBig(static_cast<unsigned>(page.size()) + 6, 2) + std::string(6, '\0') + page;
        return true;
    }
    case 0x5C: // READ BUFFER CAPACITY
        reply = toBig(10, 4) + toBig(2 << 20, 4) + toBig(2 << 20, 4);
        return true;
    case 0x5D: // SEND CUE SHEET
        burner.cueSheet = data;
        return true;
    case 0xA1: // BLANK
        burner.wasBlanked = disc.isBlank = burner.isRewritable;
        return burner.isRewritable;
    case 0xAC: // GET PERFORMANCE
        reply = toBig(4, 4) + std::string(4, '\0');
        return true;
    default:
        return false;
    }
}

// Resolves the pointer at that place of the structure to so many bytes.
UMockdevIoctlData* resolve(UMockdevIoctlData* data, size_t offset, size_t size) {
    return umockdev_ioctl_data_resolve(data, offset, size, nullptr);
}

std::string copy(const UMockdevIoctlData* data, size_t size) {
    return {reinterpret_cast<const char*>(data->data), size};
}

void put(UMockdevIoctlData* data, const void* bytes, size_t size) {
    umockdev_ioctl_data_update(data, 0, static_cast<guint8*>(const_cast<void*>(bytes)),
                               static_cast<gint>(size));
}

void sendCommand(UMockdevIoctlData* arg) {
    UMockdevIoctlData* const data = resolve(arg, 0, sizeof(sg_io_hdr_t));
    sg_io_hdr_t header;
    std::memcpy(&header, data->data, sizeof header);
    UMockdevIoctlData* const command = resolve(data, offsetof(sg_io_hdr_t, cmdp), header.cmd_len);
    UMockdevIoctlData* const buffer =
        header.dxfer_len > 0 ? resolve(data, offsetof(sg_io_hdr_t, dxferp), header.dxfer_len) : nullptr;
    std::string reply, sent;
    if (buffer && header.dxfer_direction == SG_DXFER_TO_DEV) sent = copy(buffer, header.dxfer_len);
    const bool isDone = answer(command->data, sent, reply);
    header.status = header.host_status = header.driver_status = 0;
    header.sb_len_wr = 0;
    header.resid = 0;
    if (isDone && buffer && header.dxfer_direction == SG_DXFER_FROM_DEV) {
        reply.resize(header.dxfer_len);
        put(buffer, reply.data(), reply.size());
    }
    if (!isDone) {
        char text[8];
        std::snprintf(text, sizeof text, "%02X ", command->data[0]);
        fakeBurner().unknown += text;
        // Illegal request, or a fault of the medium for a write.
        std::string sense(18, '\0');
        sense[0] = '\x70';
        sense[2] = command->data[0] == 0x2A ? 3 : 5;
        sense[7] = 10;
        sense[12] = command->data[0] == 0x2A ? '\x0C' : '\x20';
        UMockdevIoctlData* const place = resolve(data, offsetof(sg_io_hdr_t, sbp), header.mx_sb_len);
        sense.resize(std::min<size_t>(sense.size(), header.mx_sb_len));
        put(place, sense.data(), sense.size());
        g_object_unref(place);
        header.status = 2;
        header.driver_status = 8;
        header.sb_len_wr = static_cast<unsigned char>(sense.size());
    }
    // Without the pointers, which have been replaced by those of this process.
    std::memcpy(&header.dxferp, data->data + offsetof(sg_io_hdr_t, dxferp), sizeof header.dxferp);
    put(data, &header, sizeof header);
    if (buffer) g_object_unref(buffer);
    g_object_unref(command);
    g_object_unref(data);
}

gboolean onIoctl(UMockdevIoctlBase* base, UMockdevIoctlClient* client) {
    const gulong request = umockdev_ioctl_client_get_request(client);
    if (request == kGetIdLun || request == kGetBusNumber) { // all zero
        const std::string zeros(request == kGetIdLun ? 8 : 4, '\0');
        UMockdevIoctlData* const data = resolve(umockdev_ioctl_client_get_arg(client), 0, zeros.size());
        put(data, zeros.data(), zeros.size());
        g_object_unref(data);
        umockdev_ioctl_client_complete(client, 0, 0);
        return TRUE;
    }
    if (request != SG_IO) {
        auto* const parent = static_cast<UMockdevIoctlBaseClass*>(
            g_type_class_peek(g_type_parent(G_TYPE_FROM_INSTANCE(base))));
        return parent->handle_ioctl(base, client);
    }
    sendCommand(umockdev_ioctl_client_get_arg(client));
    umockdev_ioctl_client_complete(client, 0, 0);
    return TRUE;
}

// The handler of the drive that reads, with the commands for writing.
GType getHandlerType() {
    static const GType s_type = [] {
        { const CFakeDrive registered; }
        const GType parent = g_type_from_name("FakeDriveHandler");
        GTypeQuery query{};
        g_type_query(parent, &query);
        return g_type_register_static_simple(
            parent, "FakeBurnerHandler", query.class_size,
            [](gpointer type, gpointer) {
                static_cast<UMockdevIoctlBaseClass*>(type)->handle_ioctl = onIoctl;
            },
            query.instance_size, nullptr, GTypeFlags(0));
    }();
    return s_type;
}

} // namespace

CFakeBurner::CFakeBurner()
    : m_testbed((getHandlerType(), umockdev_testbed_new())),
      m_handler(static_cast<UMockdevIoctlBase*>(g_object_new(getHandlerType(), nullptr))) {
    umockdev_testbed_add_from_string(m_testbed,
                                     "P: /devices/sr0\nN: sr0\nA: dev=11:0\\n\nE: SUBSYSTEM=block\n"
                                     "E: DEVNAME=/dev/sr0\nE: ID_CDROM=1\nE: ID_VENDOR=ACME\n"
                                     "E: ID_MODEL=Disc_writer\nE: ID_REVISION=1.00\n",
                                     nullptr);
    umockdev_testbed_attach_ioctl(m_testbed, "/dev/sr0", m_handler, nullptr);
    fakeDisc() = {};
    fakeDisc().isBlank = true;
    fakeDisc().starts = {0, 0};
    fakeBurner() = {};
}

CFakeBurner::~CFakeBurner() {
    g_object_unref(m_handler);
    g_object_unref(m_testbed);
}

} // namespace tests
