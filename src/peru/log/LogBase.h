// Common base of all logs.
#pragma once

#include "peru/Object.h"
#include "peru/log/ILog.h"
#include "peru/threads/IMutex.h"

#include <atomic>

namespace peru {

// Routes every shortcut to write(). A disabled level costs one comparison: no lock is taken and no text is
// built.
class PERU_API CLogBase : public CObject, public virtual ILog {
public:
    void setMinimumLevel(int32_t level) override;
    int32_t getMinimumLevel() const override;
    void setEnabled(bool enabled) override;
    void trace(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) override;
    void debug(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) override;
    void info(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) override;
    void warning(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) override;
    void error(const P<IString>& source, const CStringArg& text, const Lines& extra = {}) override;
    void logException(const P<IString>& source, const CException& exception) override;
    void startFeature(const P<IString>& name) override;
    void endFeature(const P<IString>& name) override;
    void addInfo(const P<IString>& name, const P<IString>& value) override;

protected:
    CLogBase();
    ~CLogBase() override;

    bool isWanted(int32_t level) const { return level >= m_threshold.load(std::memory_order_relaxed); }

private:
    void writeText(int32_t level, const P<IString>& source, const CStringArg& text, const Lines& extra);

    P<IMutex> m_settingsMutex; // guards the two members below
    int32_t m_minimumLevel = kLogTrace;
    bool m_enabled = true;
    // The lowest level that is written; above all levels while the log is disabled.
    std::atomic<int64_t> m_threshold{kLogTrace};
};

} // namespace peru
