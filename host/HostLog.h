// Hears the library's log: prints what the user wants to see, and remembers why a job failed.
#pragma once

#include "Library.h"
#include "peru/log/ILog.h"

#include <atomic>
#include <filesystem>
#include <string>

namespace host {

// Made of interfaces only, as a host that links nothing of the library can. Any thread.
class CHostLog final : public peru::ILogManager {
public:
    // Enters itself with the library for as long as it lives. What is below `printLevel` is not printed.
    CHostLog(CLibrary& library, int32_t printLevel);
    ~CHostLog() override;

    // The last failure that was logged on the calling thread since the last call of this, as a sentence
    // without the library's frame; empty when there was none.
    static std::string takeReason();
    // The same as it reads behind the name of the file that was to be read.
    static std::string takeReadReason(const std::filesystem::path& file);

    void addRef() const override { m_count.fetch_add(1); }
    void release() const override { m_count.fetch_sub(1); }
    void destroy() override {}
    peru::P<peru::IString> getObjectDesc() const override { return nullptr; }

    void setMinimumLevel(int32_t level) override { m_minimum = level; }
    int32_t getMinimumLevel() const override { return m_minimum; }
    void enterArea(const peru::P<peru::IString>&) override {}
    void leaveArea(const peru::P<peru::IString>&) override {}
    void setEnabled(bool) override {}
    void trace(const peru::P<peru::IString>&, const peru::CStringArg&, const Lines&) override {}
    void debug(const peru::P<peru::IString>&, const peru::CStringArg&, const Lines&) override {}
    void info(const peru::P<peru::IString>&, const peru::CStringArg&, const Lines&) override {}
    void warning(const peru::P<peru::IString>&, const peru::CStringArg&, const Lines&) override {}
    void error(const peru::P<peru::IString>&, const peru::CStringArg&, const Lines&) override {}
    void logException(const peru::P<peru::IString>&, const peru::CException&) override {}
    void startFeature(const peru::P<peru::IString>&) override {}
    void endFeature(const peru::P<peru::IString>&) override {}
    void addInfo(const peru::P<peru::IString>&, const peru::P<peru::IString>&) override {}
    void write(const peru::SLogMessage& message) override; // all that the library's own manager calls
    void addLog(const peru::P<peru::ILog>&, const peru::P<peru::IString>&) override {}
    bool removeLog(const peru::P<peru::ILog>&, const peru::P<peru::IString>&) override { return false; }

private:
    CLibrary& m_library;
    int32_t m_printLevel;
    std::atomic<int32_t> m_minimum{0};
    mutable std::atomic<int32_t> m_count{1};
};

} // namespace host
