#include "tonewright/exports/Barrier.h"

#include "peru/log/ILog.h"

namespace tonewright::exports {

namespace {

// A host's log may throw; the debugger output must still get the text.
void writeToLog(const peru::SLogMessage& message) noexcept {
    try {
        peru::getLogManager()->write(message);
    } catch (...) {
    }
}

} // namespace

void reportException(const peru::P<peru::IString>& text, const char* fallback) noexcept {
    try {
        peru::SLogMessage message;
        message.level = peru::kLogError;
        message.source = peru::CString::empty();
        message.text = text && text->getLength() > 0 ? text : peru::CString::fromUTF8(fallback);
        writeToLog(message);
        peru::outputDebugString(message.text);
    } catch (...) {
        // There is nowhere left to report to.
    }
}

void reportException(const char* text, const char* fallback) noexcept {
    try {
        reportException(peru::CString::fromUTF8(text ? text : ""), fallback);
    } catch (...) {
        peru::outputDebugString(fallback);
    }
}

} // namespace tonewright::exports
