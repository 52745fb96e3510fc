#include "host_support/WriterQuestions.h"

#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/PluginModuleBoxed.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/plugins/PluginExtensions.h"

#include <mutex>
#include <tuple>

namespace tonewright::host_support {

using namespace sonora2::common;
using peru::CString;

namespace {

// The plug-in, the extension, the rate, the channels and the bytes per sample.
using Question = std::tuple<std::string, std::string, int, int, int>;

std::mutex s_mutex; // guards the answers
std::map<Question, std::optional<uint32_t>> s_answers;

} // namespace

CWriterQuestions::CWriterQuestions(const P<peru::IURI>& uri, const P<IPluginHandler>& handler)
    : m_uri(uri), m_extension(CString::toStdString(getLookupKey(uri, handler->getURISuffix()))) {}

std::optional<uint32_t> CWriterQuestions::askBoxed(ISonoraPlugin& plugin,
                                                   const ISonoraPlugin::SFormatParams& params) {
    const Question question{CString::toStdString(plugin.getPluginName()), m_extension, params.nSampleRate,
                            params.nChannelCount, params.nBytesPerSample};
    {
        const std::lock_guard lock(s_mutex);
        if (const auto found = s_answers.find(question); found != s_answers.end()) return found->second;
    }
    P<CFormatProbe>& probe = m_probes[&plugin];
    if (!probe) probe = dynamic_cast<CPluginModuleBoxed&>(plugin).createFormatProbe(m_uri);
    std::optional<uint32_t> answer;
    try {
        answer = probe->ask(params);
    } catch (const peru::CException&) {
        if (probe->hasFailed()) return {};
    }
    const std::lock_guard lock(s_mutex);
    s_answers[question] = answer;
    return answer;
}

std::optional<uint32_t> CWriterQuestions::ask(ISonoraPlugin& plugin, int rate, int channels, int bytes) {
    ISonoraPlugin::SFormatParams params;
    params.nSampleRate = rate;
    params.nChannelCount = channels;
    params.nBytesPerSample = bytes;
    try {
        if (dynamic_cast<CPluginModuleBoxed*>(&plugin)) return askBoxed(plugin, params);
        const P<IFormat> format = plugin.tryCreateFormat(m_uri, kAudioFormat, false, &params);
        if (!format) return {};
        const auto settings = peru::interfaceCast<IFormatSettings>(format);
        return settings ? settings->getUsedSettings() : uint32_t{IFormatSettings::kAllSettings};
    } catch (const peru::CException&) {
        return {};
    }
}

} // namespace tonewright::host_support
