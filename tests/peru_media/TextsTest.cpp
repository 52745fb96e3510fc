#include "peru/media/AudioFormat.h"
#include "peru/media/DeviceNames.h"
#include "peru/media/Errors.h"

#include <gtest/gtest.h>

using namespace peru;
using namespace peru::media;

TEST(DeviceNames, TellHostApiAndDefault) {
    const struct {
        int32_t type; // the engine's number for it
        const char* name;
    } cases[] = {{2, "MMSystem"}, {1, "DirectShow"}, {13, "WASAPI"},
                 {8, "UNKNOWN"},  {0, "UNKNOWN"},    {-1, "UNKNOWN"}};
    for (const auto& each : cases) EXPECT_TRUE(getHostApiName(each.type)->equals(each.name)) << each.type;
    EXPECT_TRUE(getHostApiDisplayName(12, "JACK Audio Connection Kit")->equals("JACK"));
    EXPECT_TRUE(getHostApiDisplayName(2, "MME")->equals("MME"));

    EXPECT_TRUE(getDeviceListName(3, CString::fromUTF8("100 % K\xC3\xB6nig"), "UNKNOWN", false)
                    ->equals(CString::fromUTF8("ID: 3 - 100 % K\xC3\xB6nig (UNKNOWN)")));
    EXPECT_TRUE(
        getDeviceListName(0, "default", "WASAPI", true)->equals("ID: 0 - default (WASAPI) [DEFAULT]"));
}

TEST(MediaErrors, CarryTheEnginesText) {
    const P<CException> copy = CPortaudioException(-9997).clone();
    EXPECT_STREQ(copy->what(), "Invalid sample rate");
    EXPECT_THROW(copy->raise(), CMediaException);
}
