#include "tonewright/exports/Barrier.h"

#include "peru/log/ILog.h"

namespace tonewright::exports {

namespace {

// A log of the host's may throw, and must not keep the text from the debugger.
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
        // Nothing is left that could be told of it.
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
