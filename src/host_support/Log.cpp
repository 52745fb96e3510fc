#include "host_support/Guard.h"
#include "peru/ClassName.h"
#include "peru/log/LogBase.h"
#include "peru/strings/LocalizedFormat.h"

using namespace tonewright::host_support;
using peru::CString;

namespace {

thread_local bool t_isCalling = false;

// Implements the manager interface because the front library accepts only managers. It has no sinks.
class CCallbackLog : public peru::CLogBase, public peru::ILogManager {
public:
    CCallbackLog(int32_t minimumLevel, TONEWRIGHT_LogCallback callback, void* user)
        : m_callback(callback), m_user(user) {
        setMinimumLevel(minimumLevel);
    }
    ~CCallbackLog() override = default;

    void enterArea(const P<peru::IString>&) override {}
    void leaveArea(const P<peru::IString>&) override {}
    void addLog(const P<peru::ILog>&, const P<peru::IString>&) override {}
    bool removeLog(const P<peru::ILog>&, const P<peru::IString>&) override { return false; }

    void write(const peru::SLogMessage& message) override {
        if (t_isCalling || !isWanted(message.level)) return;
        const std::string component = toText(message.source);
        std::string text = toText(message.text);
        for (const P<peru::IString>& line : message.extraLines) text += "\n" + toText(line);
        std::string kind, title, reason;
        if (message.exception) {
            const auto& exception = *message.exception;
            kind = peru::getClassName(typeid(exception));
            title = toText(exception.getTitle());
            reason = toText(exception.getDescription());
        }
        const TONEWRIGHT_LogMessage record{sizeof(record), message.level, component.c_str(), text.c_str(),
                                           kind.c_str(),   title.c_str(), reason.c_str()};
        t_isCalling = true;
        m_callback(&record, m_user);
        t_isCalling = false;
    }

private:
    static std::string toText(const P<peru::IString>& text) {
        return text ? CString::toStdString(text) : std::string();
    }

    const TONEWRIGHT_LogCallback m_callback;
    void* const m_user;
};

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateLog(int32_t minimumLevel, TONEWRIGHT_LogCallback callback,
                                            void* user) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        if (!callback)
            throw peru::CError(peru::localize("tonewright.Log.noCallback", "A log needs a callback"));
        return wrap(peru::make<CCallbackLog>(minimumLevel, callback, user));
    });
}
