// Loads one plug-in and serves it to the host.
#pragma once

#include "peru/pipes/IPipeClient.h"
#include "peru/remote/RemoteStreamClient.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/plugins/ISonoraPlugin.h"
#include "sonora2_slave/SlaveLog.h"

#include <atomic>
#include <string>

namespace slave {

struct SSlaveOptions {
    std::string pipeName;
    std::string pluginName;
    int32_t logLevel = 0; // ESeverity
    int64_t flags = 0;    // of the context
    bool switchB = false; // of the context
};

class CSlave {
public:
    explicit CSlave(const SSlaveOptions& options);
    ~CSlave();
    CSlave(const CSlave&) = delete;
    CSlave& operator=(const CSlave&) = delete;

    // Connects to the host and serves it until it calls "Quit" or closes the pipe. A plug-in that cannot be
    // loaded is an error of every call. Returns false if there is no host. After "Quit", sources and formats
    // are destroyed; otherwise they are left as they are, since closing a format would complete its file.
    bool run();

private:
    class CQuit;

    void readContext();
    void loadPlugin();
    P<peru::IURI> findLibrary() const;
    sonora2::common::ISonoraPlugin& requirePlugin() const;
    void servePlugin();
    void beforeMedia(const P<peru::IURI>& medium, bool isWritten);
    void loadResampler() const;
    void confine(const P<peru::IURI>& medium, bool isWritten);

    SSlaveOptions m_options;
    P<CSlaveLog> m_log;
    P<sonora2::audio::CSonoraContextAudio> m_context;
    P<peru::IPipeClient> m_pipe;
    P<sonora2::common::ISonoraPlugin> m_plugin;
    P<peru::CException> m_loadFailure;
    P<peru::CRemoteStreamClient> m_remote; // destroyed first: its procedures hold objects of the plug-in
    bool m_isConfined = false;
    std::atomic<bool> m_hasQuit{false};
};

} // namespace slave
