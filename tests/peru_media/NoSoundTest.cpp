// Machines without a sound device or with a broken sound configuration.
#include "peru/GlobalObjFactory.h"
#include "peru/Object.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"
#include "support/Environment.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <string>

using namespace peru;
using namespace peru::media;
using tests::CEnvironment;
using tests::CTempFolder;

namespace {

class NoSound : public testing::Test {
protected:
    NoSound() { CGlobalObjFactory::shutdown(); }
    ~NoSound() override { CGlobalObjFactory::shutdown(); }

    // Nothing listens there.
    CTempFolder folder;
    const std::string nobody = "unix:" + (folder / "nobody").string();
    CEnvironment server{"PULSE_SERVER", nobody};
    CEnvironment runtime{"PULSE_RUNTIME_PATH", folder.path().string()};
    CEnvironment jack{"JACK_NO_START_SERVER", "1"};
};

} // namespace

TEST_F(NoSound, GivesEmptyAnswersAndNoNoise) {
    const std::string configurations[] = {
        folder.write("dead.conf", "pcm.default { type pulse server \"" + nobody + "\" }").string(),
        folder.write("empty.conf", "").string(),
        folder.write("no-default.conf", "pcm.other { type null }").string(),
        (folder / "missing.conf").string()};
    for (const std::string& configuration : configurations) {
        SCOPED_TRACE(configuration);
        const CEnvironment alsa("ALSA_CONFIG_PATH", configuration);
        testing::internal::CaptureStderr();
        {
            const P<ISystem> system = getSystem();
            EXPECT_FALSE(system->getOutDevices().hasMore());
            EXPECT_FALSE(system->getInDevices().hasMore());
            EXPECT_FALSE(system->getDefaultOutDevice());
            EXPECT_FALSE(system->getDefaultInDevice());
        }
        CGlobalObjFactory::shutdown();
        EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    }
}

TEST_F(NoSound, TellsOfAConfigurationThatCannotBeRead) {
    const CEnvironment alsa("ALSA_CONFIG_PATH", folder.write("bad.conf", "pcm { x").string());
    testing::internal::CaptureStderr();
    EXPECT_THROW(getSystem(), CMediaException);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    // The next call tries again.
    folder.write("bad.conf", "");
    EXPECT_FALSE(getSystem()->getDefaultOutDevice());
}
