// What a store had to leave out.
#pragma once

#include "graphics/Api.h"
#include "peru/strings/IString.h"

#include <string>
#include <vector>

namespace graphics {

// Each report is also a warning in the log. A damaged file can have any number of faults, so only the first
// ones count.
class GRAPHICS_API CLoadReports {
public:
    static constexpr size_t kMaximalCount = 1000;

    void Add(const peru::P<peru::IString>& text);
    const std::vector<std::string>& Get() const { return m_texts; }

private:
    std::vector<std::string> m_texts;
};

} // namespace graphics
