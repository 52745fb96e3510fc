#include "discio2/FakeDrive.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>

namespace tests {

SFakeDisc& fakeDisc() {
    static SFakeDisc s_disc;
    return s_disc;
}

namespace {

constexpr int kSectorBytes = 2352;

std::string toBig(unsigned value, int bytes) {
    std::string text;
    for (int i = bytes; i-- > 0;) text += static_cast<char>(value >> 8 * i);
    return text;
}

// One descriptor of a table of contents; track 0xAA is the lead-out.
std::string describeTrack(int number, int block) {
    return std::string("\0\x10", 2) + static_cast<char>(number) + '\0' +
           toBig(static_cast<unsigned>(block), 4);
}

// The answer to a command of the drive; false if the drive refuses it.
bool answer(const unsigned char* command, std::string& reply) {
    SFakeDisc& disc = fakeDisc();
    const auto count = static_cast<int>(disc.starts.size()) - 1;
    switch (command[0]) {
    case 0x46: // GET CONFIGURATION: the profile of a pressed or a recordable CD
        reply = toBig(4, 4) + std::string(2, '\0') + toBig(disc.isBlank ? 9 : 8, 2);
        return true;
    case 0x51: // READ DISC INFORMATION
        reply = toBig(32, 2) + (disc.isBlank ? '\0' : '\2') + std::string(29, '\0');
        reply[21] = 79;
        reply[22] = 59;
        reply[23] = 74;
        return true;
    case 0x43: { // READ TOC
        const int format = command[2] & 0xF ? command[2] & 0xF : command[9] >> 6;
        if (disc.isBlank) return false;
        if (format == 5 && disc.textPacks.empty()) return false;
        std::string list;
        if (format == 5) list = disc.textPacks;
        if (format == 0)
            for (int i = 0; i <= count; ++i)
                list += describeTrack(i < count ? i + 1 : 0xAA, disc.starts[static_cast<size_t>(i)]);
        reply = toBig(static_cast<unsigned>(list.size()) + 2, 2) + std::string("\1") +
                static_cast<char>(count) + list;
        return format == 0 || format == 5;
    }
    case 0xBE: { // READ CD
        const int block = command[2] << 24 | command[3] << 16 | command[4] << 8 | command[5];
        const int blocks = command[6] << 16 | command[7] << 8 | command[8];
        if (block < 0 || block + blocks > disc.starts.back()) return false;
        if (disc.badBlock >= block && disc.badBlock < block + blocks) return false;
        reply = disc.samples.substr(static_cast<size_t>(block) * kSectorBytes,
                                    static_cast<size_t>(blocks) * kSectorBytes);
        if (disc.shakyReads > 0 && blocks > 1) { // a drive that does not find its place
            --disc.shakyReads;
            std::rotate(reply.begin(), reply.begin() + 400, reply.end());
        }
        return true;
    }
    case 0x12: // INQUIRY
        reply.assign("\5\x80\2\2\x1f\0\0\0", 8).append("ACME    Disc reader     1.00");
        return true;
    default:
        return false;
    }
}

void put(UMockdevIoctlData* data, gsize offset, const std::string& bytes) {
    umockdev_ioctl_data_update(data, offset,
                               const_cast<guint8*>(reinterpret_cast<const guint8*>(bytes.data())),
                               static_cast<gint>(bytes.size()));
}

template <class T> T get(UMockdevIoctlData* data) {
    T value;
    std::memcpy(&value, data->data, sizeof value);
    return value;
}
template <class T> void set(UMockdevIoctlData* data, const T& value) {
    put(data, 0, {reinterpret_cast<const char*>(&value), sizeof value});
}

int sendPacket(UMockdevIoctlData* arg) {
    UMockdevIoctlData* data = umockdev_ioctl_data_resolve(arg, 0, sizeof(cdrom_generic_command), nullptr);
    const auto command = get<cdrom_generic_command>(data);
    std::string reply;
    bool isDone = fakeDisc().isPresent || command.cmd[0] == 0x12;
    isDone = isDone && answer(command.cmd, reply);
    if (isDone && command.buffer && command.buflen > 0) {
        UMockdevIoctlData* buffer = umockdev_ioctl_data_resolve(data, offsetof(cdrom_generic_command, buffer),
                                                                command.buflen, nullptr);
        reply.resize(command.buflen);
        put(buffer, 0, reply);
        g_object_unref(buffer);
    }
    g_object_unref(data);
    return isDone ? 0 : EIO;
}

// The error of the call, 0 for success; `result` is what it returns.
int handle(gulong request, UMockdevIoctlData* arg, int& result) {
    SFakeDisc& disc = fakeDisc();
    const auto count = static_cast<int>(disc.starts.size()) - 1;
    switch (request) {
    case CDROM_DRIVE_STATUS:
        result = disc.isPresent ? CDS_DISC_OK : CDS_NO_DISC;
        return 0;
    case CDROM_MEDIA_CHANGED:
        result = disc.hasChanged;
        return 0;
    case CDROM_GET_CAPABILITY:
        result = CDC_PLAY_AUDIO | CDC_MEDIA_CHANGED;
        return 0;
    case CDROM_DISC_STATUS:
        result = disc.isPresent ? CDS_AUDIO : CDS_NO_INFO;
        return 0;
    case CDROMREADTOCHDR: {
        if (!disc.isPresent || disc.isBlank) return ENOMEDIUM;
        UMockdevIoctlData* data = umockdev_ioctl_data_resolve(arg, 0, sizeof(cdrom_tochdr), nullptr);
        set(data, cdrom_tochdr{1, static_cast<__u8>(count)});
        g_object_unref(data);
        return 0;
    }
    case CDROMREADTOCENTRY: {
        if (!disc.isPresent || disc.isBlank) return ENOMEDIUM;
        UMockdevIoctlData* data = umockdev_ioctl_data_resolve(arg, 0, sizeof(cdrom_tocentry), nullptr);
        auto entry = get<cdrom_tocentry>(data);
        const int index = entry.cdte_track == CDROM_LEADOUT ? count : entry.cdte_track - 1;
        if (index < 0 || index > count) {
            g_object_unref(data);
            return EINVAL;
        }
        const int block = disc.starts[static_cast<size_t>(index)];
        entry.cdte_adr = 1;
        entry.cdte_ctrl = 0;
        if (entry.cdte_format == CDROM_MSF) {
            const int frames = block + 150;
            entry.cdte_addr.msf = {static_cast<__u8>(frames / 4500), static_cast<__u8>(frames / 75 % 60),
                                   static_cast<__u8>(frames % 75)};
        } else {
            entry.cdte_addr.lba = block;
        }
        set(data, entry);
        g_object_unref(data);
        return 0;
    }
    case CDROM_SEND_PACKET:
        return sendPacket(arg);
    default:
        return ENOTTY;
    }
}

struct SHandler {
    UMockdevIoctlBase parent;
};
struct SHandlerClass {
    UMockdevIoctlBaseClass parent;
};

gboolean onIoctl(UMockdevIoctlBase*, UMockdevIoctlClient* client) {
    int result = 0;
    const int error =
        handle(umockdev_ioctl_client_get_request(client), umockdev_ioctl_client_get_arg(client), result);
    umockdev_ioctl_client_complete(client, error == 0 ? result : -1, error);
    return TRUE;
}

GType getHandlerType() {
    static const GType s_type = g_type_register_static_simple(
        UMOCKDEV_TYPE_IOCTL_BASE, "FakeDriveHandler", sizeof(SHandlerClass),
        [](gpointer type, gpointer) { static_cast<UMockdevIoctlBaseClass*>(type)->handle_ioctl = onIoctl; },
        sizeof(SHandler), nullptr, GTypeFlags(0));
    return s_type;
}

} // namespace

CFakeDrive::CFakeDrive()
    : m_testbed(umockdev_testbed_new()),
      m_handler(static_cast<UMockdevIoctlBase*>(g_object_new(getHandlerType(), nullptr))) {
    umockdev_testbed_add_from_string(
        m_testbed,
        "P: /devices/sr0\nN: sr0\nA: dev=11:0\\n\nE: SUBSYSTEM=block\nE: DEVNAME=/dev/sr0\n"
        "E: ID_CDROM=1\nE: ID_VENDOR=ACME\nE: ID_MODEL=Disc_reader\n"
        "E: ID_REVISION=1.00\n",
        nullptr);
    m_device = "/sys/devices/sr0";
    // The contents of the node do not matter, its presence does.
    umockdev_testbed_attach_ioctl(m_testbed, "/dev/sr0", m_handler, nullptr);
}

CFakeDrive::~CFakeDrive() {
    g_object_unref(m_handler);
    g_object_unref(m_testbed);
}

void CFakeDrive::announce(bool hasMedium) {
    umockdev_testbed_set_property(m_testbed, m_device.c_str(), "ID_CDROM_MEDIA", hasMedium ? "1" : "0");
    umockdev_testbed_uevent(m_testbed, m_device.c_str(), "change");
}

} // namespace tests
