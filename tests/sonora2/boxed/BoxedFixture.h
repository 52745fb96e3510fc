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

// What /proc says of a process: its name, its state and its parent.
struct SProcessState {
    std::string name;
    char state = 0; // 0 if there is no such process
    pid_t parent = 0;
};

inline SProcessState readState(const std::string& id) {
    std::ifstream file("/proc/" + id + "/stat");
    std::string text;
    std::getline(file, text);
    const size_t open = text.find('('), close = text.rfind(')');
    if (close == std::string::npos) return {};
    return {text.substr(open + 1, close - open - 1), text[close + 2],
            static_cast<pid_t>(std::stol(text.substr(close + 4)))};
}

// The processes of this name that this process has started, zombies included.
inline std::vector<pid_t> findChildren(const std::string& name) {
    std::vector<pid_t> found;
    for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
        const std::string id = entry.path().filename();
        if (id.find_first_not_of("0123456789") != std::string::npos) continue;
        const SProcessState state = readState(id);
        if (state.name == name && state.parent == ::getpid()) found.push_back(std::stoi(id));
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
        EXPECT_TRUE(findChildren("sonora2_slave").empty()) << "a slave is left";
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
    static pid_t slaveOf() {
        const std::vector<pid_t> children = findChildren("sonora2_slave");
        return children.size() == 1 ? children.front() : 0;
    }

    // Returns once the signal has taken effect: until then the slave may go on to serve calls.
    static void signalSlave(int signal) {
        const pid_t slave = slaveOf();
        ASSERT_NE(slave, 0);
        ASSERT_EQ(::kill(slave, signal), 0);
        const std::string states = signal == SIGSTOP ? "T" : std::string("ZX\0", 3);
        for (int i = 0; i < 20'000; ++i) {
            if (states.find(readState(std::to_string(slave)).state) != std::string::npos) return;
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        FAIL() << "the signal has no effect";
    }

    static constexpr int kDeadline = 20'000; // milliseconds; for tests without a hang

    CTempFolder folder;
    CTempFolder plugins;
    peru::P<sonora2::audio::CSonoraContextAudio> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    peru::P<sonora2::common::CPluginHandler> plain;
    peru::P<sonora2::common::CPluginHandler> boxed;
};

} // namespace tests
