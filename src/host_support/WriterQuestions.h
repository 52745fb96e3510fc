// Asks the plug-ins what they can write.
#pragma once

#include "sonora2/boxed/FormatProbe.h"
#include "sonora2/plugins/IPluginHandler.h"

#include <map>
#include <optional>

namespace tonewright::host_support {

using peru::P;

// Answers of plug-ins that run in a process of their own are remembered for the life of this process, since
// each could cost the start of a slave; they are taken to depend on the extension of the target only. A
// failure of a slave is not remembered.
class CWriterQuestions {
public:
    CWriterQuestions(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler);

    // The settings (IFormatSettings) that the format of `plugin` uses for samples of that form; empty if it
    // does not write them, whatever the reason.
    std::optional<uint32_t> ask(sonora2::common::ISonoraPlugin& plugin, int rate, int channels, int bytes);

private:
    std::optional<uint32_t> askBoxed(sonora2::common::ISonoraPlugin& plugin,
                                     const sonora2::common::ISonoraPlugin::SFormatParams& params);

    P<peru::IURI> m_uri;
    std::string m_extension;
    std::map<const sonora2::common::ISonoraPlugin*, P<sonora2::common::CFormatProbe>> m_probes;
};

} // namespace tonewright::host_support
