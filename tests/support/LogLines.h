// A log that keeps its lines.
#pragma once

#include "sonora2/context/ILogManager.h"
#include "support/Files.h"

#include <mutex>
#include <string>
#include <vector>

namespace tests {

class CLogLines : public peru::CObject, public sonora2::common::ILogManager {
public:
    void log(int32_t, const peru::P<peru::IString>& line) override {
        std::lock_guard lock(m_mutex);
        lines.push_back(text(line));
    }
    void logException(const peru::CException& exception) override { log(0, exception.getDescription()); }
    std::vector<std::string> lines;

private:
    std::mutex m_mutex;
};

} // namespace tests
