// The program's log.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <vector>

namespace peru {

// Severity in ascending order; EXCEPTION intentionally ranks below ERROR. The levels of sonora2's own
// ILogManager run the other way: there 0 is the most severe.
enum ELogLevel : int32_t {
    kLogTrace = 0,
    kLogDebug = 1,
    kLogInfo = 2,
    kLogWarning = 3,
    kLogException = 4,
    kLogError = 5,
};

// A message for the sinks.
struct SLogMessage {
    int32_t level = kLogInfo;
    P<IString> source; // the component; may be empty
    P<IString> text;
    std::vector<P<IString>> extraLines;
    int64_t time = -1;                 // milliseconds since 1970 UTC; -1 means now
    P<CException> exception = nullptr; // a copy of the exception that the text describes; usually empty
};

// A sink, or the manager that distributes to sinks. Any thread may log, so a sink may be called on any
// thread, but the manager makes one call at a time. It holds its re-entrant mutex during the call. A sink may
// therefore log through the manager and add or remove sinks, itself included, but it must not wait for
// another thread that does any of this: that is a deadlock.
class PERU_API ILog : public virtual IBase {
public:
    using Lines = std::vector<P<IString>>;

    virtual void setMinimumLevel(int32_t level) = 0;
    virtual int32_t getMinimumLevel() const = 0;
    // A sink whose enterArea throws has not entered the area and gets no leaveArea for it.
    virtual void enterArea(const P<IString>& name) = 0;
    virtual void leaveArea(const P<IString>& name) = 0;
    virtual void setEnabled(bool enabled) = 0;
    virtual void trace(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) = 0;
    virtual void debug(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) = 0;
    virtual void info(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) = 0;
    virtual void warning(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) = 0;
    virtual void error(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) = 0;
    virtual void logException(const P<IString>& source, const CException& exception) = 0;
    virtual void startFeature(const P<IString>& name) = 0;
    virtual void endFeature(const P<IString>& name) = 0;
    virtual void addInfo(const P<IString>& name, const P<IString>& value) = 0;
    // All message operations above end here. Levels outside the enumeration are allowed.
    virtual void write(const SLogMessage& message) = 0;
};

class PERU_API ILogManager : public virtual ILog {
public:
    // With an empty source the log receives every message. A log that is added during a call does not take
    // part in that call; one that is removed receives nothing after removeLog has returned, on any thread.
    virtual void addLog(const P<ILog>& log, const P<IString>& source) = 0;
    // Returns whether the log was registered for that source.
    virtual bool removeLog(const P<ILog>& log, const P<IString>& source) = 0;
};

PERU_API P<ILogManager> getLogManager();

// The debugger trace: writes one line to the platform's debug output, in release builds too. That output is
// standard error; TONEWRIGHT_DEBUG_OUTPUT=0 in the environment switches it off.
PERU_API void zvrTrace(const char* file, int line, const char* comment = nullptr);
PERU_API void outputDebugString(const CStringArg& text);

} // namespace peru
