// What the slave is doing, for its crash report.
#pragma once

#include <string>

namespace slave {

// The text is read by the crash handler at any time, so it is always terminated. Only the thread that serves
// calls changes it; a crash in the middle of a change shows parts of both texts.
class CCrashDetails {
public:
    static const char* getText();
    static void setPlugin(const std::string& name);
    static void setFile(const std::string& name);

    // The operation that is executed during the scope.
    class CCall {
    public:
        explicit CCall(const char* operation); // a literal
        ~CCall();
        CCall(const CCall&) = delete;
        CCall& operator=(const CCall&) = delete;
    };

private:
    static void write();
};

} // namespace slave
