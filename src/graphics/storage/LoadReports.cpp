#include "graphics/storage/LoadReports.h"

#include "peru/log/LogManager.h"
#include "peru/strings/String.h"

namespace graphics {

void CLoadReports::Add(const peru::P<peru::IString>& text) {
    if (m_texts.size() == kMaximalCount) return;
    peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), text);
    m_texts.push_back(peru::CString::toStdString(text));
}

} // namespace graphics
