// What a boxed plug-in can write.
#pragma once

#include "peru/Object.h"
#include "sonora2/boxed/SlaveHandler.h"
#include "sonora2/plugins/ISonoraPlugin.h"

#include <optional>

namespace sonora2::common {

// Answers any number of questions about one target with a single slave, which starts with the first question
// and ends with this object. One thread at a time.
class SONORA2_API CFormatProbe : public peru::CObject {
public:
    CFormatProbe(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                 const P<peru::IURI>& uri);
    ~CFormatProbe() override;

    // The settings (IFormatSettings) that an audio format with these parameters uses; empty if the plug-in
    // declines. Creates no file. Throws CSonoraError if the plug-in does, or if the slave fails, then for
    // every question that follows.
    std::optional<uint32_t> ask(const ISonoraPlugin::SFormatParams& params);
    // Whether the slave has failed, which says nothing about what the plug-in can write.
    bool hasFailed() const { return !m_plugin || m_slave->hasFailed(); }

private:
    P<ISonoraContext> m_context;
    P<peru::IString> m_pluginName;
    P<peru::IURI> m_uri;
    P<CSlaveHandler> m_slave;
    P<CSonoraPluginClient> m_plugin; // empty until the slave has started
};

} // namespace sonora2::common
