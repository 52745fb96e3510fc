#include "discio2/FakeDrive.h"

#include <cerrno>
#include <cstddef>
#include <cstring>
#include <fstream>
#include <linux/cdrom.h>

namespace tests {

namespace {

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
        result = disc.notReady-- > 0 ? CDS_DRIVE_NOT_READY : disc.isPresent ? CDS_DISC_OK : CDS_NO_DISC;
        return 0;
    case CDROMEJECT:
    case CDROMCLOSETRAY:
        disc.trayMoves += request == CDROMEJECT ? 'o' : 'c';
        return disc.trayError;
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
        entry.cdte_ctrl = disc.dataTracks.contains(static_cast<size_t>(index)) ? CDROM_DATA_TRACK : 0;
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
    case CDROMMULTISESSION: {
        if (!disc.isPresent || disc.isBlank) return ENOMEDIUM;
        UMockdevIoctlData* data = umockdev_ioctl_data_resolve(arg, 0, sizeof(cdrom_multisession), nullptr);
        auto session = get<cdrom_multisession>(data);
        session.addr.lba = disc.sessionStart;
        session.addr_format = CDROM_LBA;
        session.xa_flag = disc.sessionStart > 0;
        set(data, session);
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
    umockdev_testbed_add_from_string(
        m_testbed,
        "P: /devices/sdb\nN: sdb\nA: dev=8:16\\n\nE: SUBSYSTEM=block\nE: DEVTYPE=disk\nE: DEVNAME=/dev/sdb\n"
        "E: ID_BUS=usb\n",
        nullptr);
    umockdev_testbed_attach_ioctl(m_testbed, "/dev/sr0", m_handler, nullptr);
}

CFakeDrive::~CFakeDrive() {
    g_object_unref(m_handler);
    g_object_unref(m_testbed);
}

void CFakeDrive::announce(const std::string& name, bool hasMedium, bool isChanged) {
    const std::string device = "/sys/devices/" + name;
    umockdev_testbed_set_property(m_testbed, device.c_str(), "ID_CDROM_MEDIA", hasMedium ? "1" : "0");
    umockdev_testbed_set_property(m_testbed, device.c_str(), "DISK_MEDIA_CHANGE", isChanged ? "1" : "0");
    umockdev_testbed_uevent(m_testbed, device.c_str(), "change");
}

void CFakeDrive::setData(const std::string& bytes, int block) {
    gchar* root = umockdev_testbed_get_root_dir(m_testbed);
    std::ofstream device(std::string(root) + "/dev/sr0", std::ios::binary);
    device.seekp(std::streamoff{block} * 2048);
    device << bytes;
    g_free(root);
}

} // namespace tests
