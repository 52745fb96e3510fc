#include "HostLog.h"

#include "AudioFile.h"
#include "Text.h"
#include "peru/IInstanceWrapper.h"

#include <cstdio>
#include <string_view>
#include <utility>

namespace host {

namespace {

thread_local std::string t_reason;
thread_local bool t_isFinal = false; // the job's own failure, which no later message replaces

std::string toText(const peru::P<peru::IString>& text) {
    if (!text) return {};
    const auto utf8 = text->toUTF8String();
    return {reinterpret_cast<const char*>(utf8->getData()), static_cast<size_t>(utf8->getDataSize())};
}

// What a candidate of the plug-in handler failed with stands behind its own words.
std::string_view withoutFrame(std::string_view message) {
    static constexpr std::string_view kFailed = "Opening failed: ";
    const size_t failed = message.find(kFailed);
    if (failed == std::string_view::npos) return message;
    message.remove_prefix(failed + kFailed.size());
    const size_t title = message.find(" - ");
    return title == std::string_view::npos ? message : message.substr(title + 3);
}

const char* levelWord(int32_t level) {
    static constexpr const char* kWords[] = {"trace", "debug", "info", "warning", "exception", "error"};
    return level >= 0 && level <= peru::kLogError ? kWords[level] : "unknown";
}

} // namespace

CHostLog::CHostLog(CLibrary& library, int32_t printLevel) : m_library(library), m_printLevel(printLevel) {
    peru::CInstanceWrapper handle(peru::P<peru::IBase>::share(this));
    m_library.AddProxyLogManager(
        reinterpret_cast<TONEWRIGHT_Handle>(static_cast<peru::IInstanceWrapper*>(&handle)));
}

CHostLog::~CHostLog() {
    peru::CInstanceWrapper handle(peru::P<peru::IBase>::share(this));
    m_library.RemoveProxyLogManager(
        reinterpret_cast<TONEWRIGHT_Handle>(static_cast<peru::IInstanceWrapper*>(&handle)));
}

void CHostLog::write(const peru::SLogMessage& message) {
    const std::string text = toText(message.text);
    if (message.level >= m_printLevel) {
        const std::string source = toText(message.source);
        std::fprintf(stderr, "%s%s%s: %s\n", levelWord(message.level), source.empty() ? "" : " ",
                     source.c_str(), text.c_str());
    }
    const bool isFinal = message.level >= peru::kLogError;
    const bool isCandidate = text.find("Opening failed: ") != std::string::npos;
    // Of several candidates the first is the one that the extension meant.
    if (t_isFinal || !(isFinal || (isCandidate && t_reason.empty()))) return;
    if (isCandidate && !t_reason.empty()) return;
    t_reason = withPaths(withoutFrame(text));
    t_isFinal = isFinal && !isCandidate;
}

std::string CHostLog::takeReason() {
    t_isFinal = false;
    return std::exchange(t_reason, {});
}

std::string CHostLog::takeReadReason(const std::filesystem::path& file) {
    const std::string reason = takeReason();
    return reason.empty() ? "No plug-in reads " + describeKind(file) : asReason(reason, file);
}

} // namespace host
