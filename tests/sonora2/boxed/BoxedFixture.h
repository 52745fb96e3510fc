// A handler whose plug-in runs in slave processes, and a look at those processes.
#pragma once

#include "peru/system/IPathes.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/plugins/PluginHandler.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <chrono>
#include <csignal>
#include <dirent.h>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace tests {

// The processes of this name that this process has started, zombies included.
inline std::vector<pid_t> findChildren(const std::string& name) {
    std::vector<pid_t> found;
    for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
        const std::string id = entry.path().filename();
        if (id.find_first_not_of("0123456789") != std::string::npos) continue;
        std::ifstream file(entry.path() / "stat");
        std::string text;
        std::getline(file, text);
        const size_t open = text.find('('), close = text.rfind(')');
        if (close == std::string::npos || text.substr(open + 1, close - open - 1) != name) continue;
        if (std::stol(text.substr(close + 4)) == ::getpid()) found.push_back(std::stoi(id));
    }
    return found;
}

inline size_t countDescriptors() {
    return countEntries("/proc/self/fd");
}

class CBoxedTest : public ::testing::Test {
protected:
    CBoxedTest() {
        using namespace sonora2::common;
        context->getBaseDirectories()->setPluginDirectory(toURI(TEST_PLUGINS "/"));
        context->addPluginName("testplugin_good");
        context->setParameter(kBoxedParameterKey, kBoxedDeadlineParameter,
                              peru::CString::fromUTF8(std::to_string(kDeadline)));
        plain = peru::make<CPluginHandler>(context);
        boxed = peru::make<CPluginHandler>(context, true);
    }
    ~CBoxedTest() override {
        EXPECT_TRUE(findChildren("sonora2_slave").empty()) << "a slave is left";
        for (const auto& entry : std::filesystem::directory_iterator(TEST_PLUGINS))
            EXPECT_FALSE(entry.path().filename().string().ends_with("_log")) << "a crash log is left";
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
    static pid_t slaveOf() {
        const std::vector<pid_t> children = findChildren("sonora2_slave");
        return children.size() == 1 ? children.front() : 0;
    }

    static constexpr int kDeadline = 20'000; // milliseconds; for tests without a hang

    CTempFolder folder;
    peru::P<sonora2::audio::CSonoraContextAudio> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    peru::P<sonora2::common::CPluginHandler> plain;
    peru::P<sonora2::common::CPluginHandler> boxed;
};

} // namespace tests
