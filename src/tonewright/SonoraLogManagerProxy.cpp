#include "tonewright/SonoraLogManagerProxy.h"

#include "peru/Exception.h"
#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"

namespace tonewright {

namespace {

int32_t toLogLevel(int32_t severity) {
    switch (severity) {
    case sonora2::common::kSeverityError:
        return peru::kLogError;
    case sonora2::common::kSeverityWarning:
        return peru::kLogWarning;
    case sonora2::common::kSeverityInfo:
        return peru::kLogInfo;
    case sonora2::common::kSeverityDebug:
        return peru::kLogDebug;
    case sonora2::common::kSeverityTrace:
        return peru::kLogTrace;
    default:
        return peru::kLogInfo;
    }
}

} // namespace

CSonoraLogManagerProxy::~CSonoraLogManagerProxy() = default;

void CSonoraLogManagerProxy::log(int32_t severity, const P<peru::IString>& text) {
    peru::SLogMessage message;
    message.level = toLogLevel(severity);
    message.source = peru::CString::empty();
    message.text = text;
    peru::getLogManager()->write(message);
}

void CSonoraLogManagerProxy::logException(const peru::CException& exception) {
    log(sonora2::common::kSeverityError,
        peru::format("Exception: %s Type: %s", exception.getTitle(), exception.getDescription()));
}

} // namespace tonewright
