// Collects the messages of the log of this process.
#pragma once

#include "peru/log/LogBase.h"
#include "support/Files.h"

#include <mutex>
#include <vector>

namespace tests {

class CPeruLogLines : public peru::CLogBase {
public:
    void enterArea(const peru::P<peru::IString>&) override {}
    void leaveArea(const peru::P<peru::IString>&) override {}
    void write(const peru::SLogMessage& message) override {
        std::scoped_lock lock(m_mutex);
        m_lines.push_back(text(message.text));
    }
    std::vector<std::string> take() {
        std::scoped_lock lock(m_mutex);
        return std::exchange(m_lines, {});
    }

private:
    std::mutex m_mutex;
    std::vector<std::string> m_lines;
};

} // namespace tests
