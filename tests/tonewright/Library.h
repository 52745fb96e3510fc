// Starts the library for a test, with a test plug-in instead of the real ones.
#pragma once

#include "peru/IInstanceWrapper.h"
#include "peru/IInterfaceQuery.h"
#include "peru/log/LogManager.h"
#include "support/FakeMedia.h"
#include "support/TempFolder.h"
#include "tonewright/tonewright.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace tests {

struct SHandleEnd {
    void operator()(TONEWRIGHT_HandleData* handle) const { TONEWRIGHT_DestroyHandle(handle); }
};
using CHandle = std::unique_ptr<TONEWRIGHT_HandleData, SHandleEnd>;

inline CHandle wrap(P<peru::IBase> object) {
    peru::IInstanceWrapper* wrapper = new peru::CInstanceWrapper(std::move(object));
    return CHandle(reinterpret_cast<TONEWRIGHT_Handle>(wrapper));
}

inline std::u16string uriOf(const std::filesystem::path& path) {
    return std::filesystem::path("file://" + path.string()).u16string(); // without characters to escape
}

// The interface that a C++ library beside the front finds behind a handle.
template <class T> P<T> behind(const CHandle& handle) {
    const auto* wrapper =
        dynamic_cast<peru::CInstanceWrapper*>(reinterpret_cast<peru::IInstanceWrapper*>(handle.get()));
    return peru::interfaceCast<T>(wrapper->getObject());
}

struct SLine {
    int32_t level;
    std::string source;
    std::string text;
    bool operator==(const SLine&) const = default;
};

// Collects log messages.
class CLines : public peru::CLogBase {
public:
    void enterArea(const P<peru::IString>&) override {}
    void leaveArea(const P<peru::IString>&) override {}
    void write(const peru::SLogMessage& message) override {
        std::scoped_lock lock(m_mutex);
        m_lines.push_back({message.level, peru::CString::toStdString(message.source),
                           peru::CString::toStdString(message.text)});
    }
    std::vector<SLine> take() {
        std::scoped_lock lock(m_mutex);
        return std::exchange(m_lines, {});
    }

private:
    std::mutex m_mutex;
    std::vector<SLine> m_lines;
};

// A host's own log, added through the exports.
class CHostLog {
public:
    CHostLog() {
        m_manager->addLog(m_lines, peru::CString::empty());
        TONEWRIGHT_AddProxyLogManager(m_handle.get());
    }
    ~CHostLog() { TONEWRIGHT_RemoveProxyLogManager(m_handle.get()); }
    std::vector<SLine> take() const { return m_lines->take(); }
    TONEWRIGHT_Handle getHandle() const { return m_handle.get(); }

private:
    P<CLines> m_lines = peru::make<CLines>();
    P<peru::CLogManager> m_manager = peru::make<peru::CLogManager>();
    CHandle m_handle = wrap(m_manager);
};

// A plug-in folder in which "sonora2_wav" is the test plug-in.
class CPluginFolder {
public:
    CPluginFolder() {
        std::filesystem::create_symlink(TEST_PLUGIN, m_folder / "sonora2_wav.so");
        setenv("TONEWRIGHT_PLUGIN_PATH", m_folder.path().c_str(), 1);
    }
    ~CPluginFolder() { unsetenv("TONEWRIGHT_PLUGIN_PATH"); }

private:
    CTempFolder m_folder;
};

class CLibraryTest : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
        log = std::make_unique<CHostLog>();
    }
    void TearDown() override {
        log.reset();
        TONEWRIGHT_DeInitAll();
    }

    CPluginFolder plugins;
    std::unique_ptr<CHostLog> log;
};

} // namespace tests
