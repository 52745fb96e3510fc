#include "tonewright/exports/Barrier.h"

#include "peru/log/ILog.h"
#include "tonewright/ReasonedError.h"

namespace tonewright::exports {

using sonora2::common::SFailure;

namespace {

// A host's log may throw; the debugger output must still get the text.
void writeToLog(const peru::SLogMessage& message) noexcept {
    try {
        peru::getLogManager()->write(message);
    } catch (...) {
    }
}

// Callers of the library ask for the reason of a failure on the thread that saw it.
void report(SFailure failure, const char* fallback) {
    if (failure.message.empty()) failure.message = fallback;
    sonora2::common::setLastFailure(failure);
    peru::SLogMessage message;
    message.level = peru::kLogError;
    message.source = peru::CString::empty();
    message.text = peru::CString::fromUTF8(failure.message);
    writeToLog(message);
    peru::outputDebugString(message.text);
}

} // namespace

void reportException(const std::exception* error) noexcept {
    try {
        if (!error) return report({"unknown", "", kUnknown, ""}, kUnknown);
        report(sonora2::common::describeFailure(*error), kUnknownStdException);
        const auto* reasoned = dynamic_cast<const CReasonedError*>(error);
        if (reasoned && !reasoned->getCause().isEmpty()) report(reasoned->getCause(), kUnknown);
    } catch (...) {
        peru::outputDebugString(kUnknown);
    }
}

void reportLastFailure() noexcept {
    try {
        const SFailure failure = sonora2::common::getLastFailure();
        if (!failure.isEmpty()) report(failure, kUnknown);
    } catch (...) {
        // There is nowhere left to report to.
    }
}

} // namespace tonewright::exports
