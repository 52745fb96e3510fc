#include "tonewright/exports/Barrier.h"

#include "peru/ILog.h"

namespace tonewright::exports {

void reportException(const peru::P<peru::IString>& text, const char* fallback) noexcept {
    try {
        peru::SLogMessage message;
        message.level = peru::kLogError;
        message.source = peru::CString::empty();
        message.text = text && text->getLength() > 0 ? text : peru::CString::fromUTF8(fallback);
        // The debugger first: a log of the host's may throw.
        peru::outputDebugString(message.text);
        peru::getLogManager()->write(message);
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
