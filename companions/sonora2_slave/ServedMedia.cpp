#include "sonora2_slave/ServedMedia.h"

#include <utility>

namespace slave {

void CFailures::keep(const peru::CException& exception) {
    if (m_first) return;
    const P<peru::IString> description = exception.getDescription();
    m_first = description->isEmpty() ? exception.getTitle() : description;
    if (m_first->isEmpty()) m_first = peru::newString("unknown exception");
}

P<peru::IString> CFailures::take() {
    const P<peru::IString> first = std::exchange(m_first, nullptr);
    return first ? first : peru::CString::empty();
}

} // namespace slave
