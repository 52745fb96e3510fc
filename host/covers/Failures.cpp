#include "Failures.h"

#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "peru/Errors.h"
#include "peru/log/LogBase.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cstdio>
#include <vector>

namespace host::covers {

using peru::P;

namespace {

class CWarnings : public peru::CLogBase {
public:
    CWarnings() { setMinimumLevel(peru::kLogWarning); }
    ~CWarnings() override = default;

    void enterArea(const P<peru::IString>&) override {}
    void leaveArea(const P<peru::IString>&) override {}
    void write(const peru::SLogMessage& message) override {
        if (!isWanted(message.level) || !message.text) return;
        const std::string text = peru::CString::toStdString(message.text);
        if (std::find(texts.begin(), texts.end(), text) == texts.end()) texts.push_back(text);
    }

    std::vector<std::string> texts;
};

// Adds a sink to the log for as long as the object exists.
class CCollectedWarnings {
public:
    CCollectedWarnings() { peru::getLogManager()->addLog(m_warnings, peru::CString::empty()); }
    ~CCollectedWarnings() { peru::getLogManager()->removeLog(m_warnings, peru::CString::empty()); }
    CCollectedWarnings(const CCollectedWarnings&) = delete;
    CCollectedWarnings& operator=(const CCollectedWarnings&) = delete;

    void print(const std::filesystem::path& file) const {
        for (const std::string& text : m_warnings->texts) printFailure(file, asReason(withPaths(text), file));
    }

private:
    const P<CWarnings> m_warnings = peru::make<CWarnings>();
};

} // namespace

void printFailure(const std::filesystem::path& file, const std::string& reason) {
    std::fprintf(stderr, "tonewright-covers: %s: %s\n", toPrintable(file.native()).c_str(),
                 toPrintable(reason).c_str());
}

std::string getReason(const std::exception& error, const std::filesystem::path& file) {
    const auto* const own = dynamic_cast<const peru::CException*>(&error);
    // The program's own messages are worded to follow the name of the file.
    return own ? asReason(withPaths(peru::CString::toStdString(own->getDescription())), file) : error.what();
}

int runForFile(const std::filesystem::path& file, const std::function<void()>& work, bool isJson) {
    const CCollectedWarnings warnings;
    try {
        work();
    } catch (const peru::CAbortedError&) {
        // by Ctrl-C
    } catch (const std::exception& error) {
        warnings.print(file);
        const std::string reason = getReason(error, file);
        if (isJson)
            std::printf("%s\n", toLine({{"file", file.native()}, {"error", reason}}).c_str());
        else
            printFailure(file, reason);
        return kExitFailure;
    }
    if (isCancelled()) return kExitCancelled;
    warnings.print(file);
    return kExitSuccess;
}

} // namespace host::covers
