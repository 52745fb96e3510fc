#include "host_support/Guard.h"
#include "peru/media/ISystem.h"
#include "peru/strings/LocalizedFormat.h"

#include <vector>

using namespace tonewright::host_support;
using peru::CString;
using peru::media::IAudioInDevice;

namespace {

std::string toText(const P<peru::IString>& text) {
    return text ? CString::toStdString(text) : std::string();
}

class CDeviceList : public peru::CObject {
public:
    struct SEntry {
        std::string id, name, api;
        int32_t channelCount;
        bool isDefault;
    };
    std::vector<SEntry> entries;

    CDeviceList() = default;
    ~CDeviceList() override = default;

    template <class Devices> void add(Devices devices) {
        while (devices.hasMore()) {
            const auto device = devices.getNext();
            entries.push_back({toText(device->getId()), toText(device->getName()),
                               toText(device->getHostApiDisplayName()), device->getMaxChannelCount(),
                               device->isDefault()});
        }
    }
};

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_ListDevices(int32_t direction) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const auto list = peru::make<CDeviceList>();
        if (direction == TONEWRIGHT_DEVICE_INPUT)
            list->add(peru::media::getSystem()->getInDevices());
        else
            list->add(peru::media::getSystem()->getOutDevices());
        return wrap(list);
    });
}

int32_t TONEWRIGHT_Host_GetDeviceCount(TONEWRIGHT_Handle devices) {
    const P<CDeviceList> list = unwrap<CDeviceList>(devices);
    return list ? static_cast<int32_t>(list->entries.size()) : 0;
}

int32_t TONEWRIGHT_Host_GetDevice(TONEWRIGHT_Handle devices, int32_t index, TONEWRIGHT_DeviceInfo* info) {
    return guard(0, [&] {
        const P<CDeviceList> list = require<CDeviceList>(devices, "a list of devices");
        if (index < 0 || static_cast<size_t>(index) >= list->entries.size())
            throw peru::CError(peru::localize("tonewright.Devices.index", "There is no such device"));
        const CDeviceList::SEntry& entry = list->entries[static_cast<size_t>(index)];
        fillRecord(info, {sizeof(*info), entry.id.c_str(), entry.name.c_str(), entry.api.c_str(),
                          entry.channelCount, entry.isDefault ? 1 : 0});
        return 1;
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_OpenInputDevice(const char* id) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<peru::media::ISystem> system = peru::media::getSystem();
        if (!id || !*id) {
            P<IAudioInDevice> device = system->getDefaultInDevice();
            if (!device)
                throw peru::CError(
                    peru::localize("tonewright.Devices.noInput", "There is no sound device to record from"));
            return wrap(device);
        }
        for (auto devices = system->getInDevices(); devices.hasMore();) {
            const P<IAudioInDevice> device = devices.getNext();
            if (toText(device->getId()) == id) return wrap(device);
        }
        throw peru::CError(peru::format({"tonewright.Devices.noSuchInput", "There is no input device %s"},
                                        CString::fromUTF8(id)));
    });
}
