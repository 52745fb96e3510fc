// A handler whose plug-in runs in slave processes.
#pragma once

#include "peru/system/IPathes.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/plugins/PluginHandler.h"
#include "support/Children.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace tests {

inline size_t countDescriptors() {
    return countEntries("/proc/self/fd");
}

class CBoxedTest : public ::testing::Test {
protected:
    CBoxedTest() {
        using namespace sonora2::common;
        // Crash logs are created in the folder of the plug-ins, so every test has one of its own.
        std::filesystem::create_symlink(TEST_PLUGINS "/testplugin_good.so", plugins / "testplugin_good.so");
        context->getBaseDirectories()->setPluginDirectory(toURI(plugins.path()));
        context->addPluginName("testplugin_good");
        context->setParameter(kBoxedParameterKey, kBoxedDeadlineParameter,
                              peru::CString::fromUTF8(std::to_string(kDeadline)));
        plain = peru::make<CPluginHandler>(context);
        boxed = peru::make<CPluginHandler>(context, true);
    }
    ~CBoxedTest() override {
        EXPECT_TRUE(listChildren().empty()) << "a slave is left";
        EXPECT_EQ(countEntries(plugins.path()), 1u) << "a crash log is left";
    }

    peru::P<sonora2::common::IAudioSource> open(sonora2::common::CPluginHandler& handler,
                                                const std::string& name = "x.tst") {
        return handler.createAudioSource(toURI(folder / name), 8000, 2, 2, true);
    }
    // The description of what the call throws; empty if it throws nothing.
    template <class Call> static std::string reasonOf(Call call) {
        try {
            call();
        } catch (const sonora2::common::CSonoraError& error) {
            return peru::CString::toStdString(error.getDescription());
        }
        return {};
    }
    static constexpr int kDeadline = 20'000; // milliseconds; for tests without a hang

    CTempFolder folder;
    CTempFolder plugins;
    peru::P<sonora2::audio::CSonoraContextAudio> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    peru::P<sonora2::common::CPluginHandler> plain;
    peru::P<sonora2::common::CPluginHandler> boxed;
};

} // namespace tests
