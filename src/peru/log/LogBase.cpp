#include "peru/log/LogBase.h"

#include "peru/Exception.h"
#include "peru/strings/StringFormat.h"
#include "peru/threads/IMutex.h"

#include <limits>

namespace peru {

namespace {

constexpr int64_t kNothing = std::numeric_limits<int64_t>::max();

} // namespace

CLogBase::CLogBase() : m_settingsMutex(getMutexFactory()->createMutex()) {}

CLogBase::~CLogBase() = default;

void CLogBase::setMinimumLevel(int32_t level) {
    CMutexLock lock(m_settingsMutex);
    m_minimumLevel = level;
    m_threshold = m_enabled ? m_minimumLevel : kNothing;
}

int32_t CLogBase::getMinimumLevel() const {
    CMutexLock lock(m_settingsMutex);
    return m_minimumLevel;
}

void CLogBase::setEnabled(bool enabled) {
    CMutexLock lock(m_settingsMutex);
    m_enabled = enabled;
    m_threshold = m_enabled ? m_minimumLevel : kNothing;
}

void CLogBase::writeText(int32_t level, const P<IString>& source, const CStringArg& text,
                         const Lines& extra) {
    if (!isWanted(level)) return;
    write({level, source, CString::fromUTF8(CString::toStdString(text)), extra});
}

void CLogBase::trace(const P<IString>& source, const CStringArg& text, const Lines& extra) {
    writeText(kLogTrace, source, text, extra);
}

void CLogBase::debug(const P<IString>& source, const CStringArg& text, const Lines& extra) {
    writeText(kLogDebug, source, text, extra);
}

void CLogBase::info(const P<IString>& source, const CStringArg& text, const Lines& extra) {
    writeText(kLogInfo, source, text, extra);
}

void CLogBase::warning(const P<IString>& source, const CStringArg& text, const Lines& extra) {
    writeText(kLogWarning, source, text, extra);
}

void CLogBase::error(const P<IString>& source, const CStringArg& text, const Lines& extra) {
    writeText(kLogError, source, text, extra);
}

void CLogBase::logException(const P<IString>& source, const CException& exception) {
    if (!isWanted(kLogException)) return;
    P<IString> text = format("Type: %s\nText: %s", exception.getTitle(), exception.getDescription());
    write({kLogException, source, text, {}, -1, exception.clone()});
}

void CLogBase::startFeature(const P<IString>& name) {
    if (isWanted(kLogInfo)) write({kLogInfo, nullptr, format("Start Feature: %s", name), {}});
}

void CLogBase::endFeature(const P<IString>& name) {
    if (isWanted(kLogInfo)) write({kLogInfo, nullptr, format("End Feature: %s", name), {}});
}

void CLogBase::addInfo(const P<IString>& name, const P<IString>& value) {
    if (isWanted(kLogInfo)) write({kLogInfo, nullptr, format("Add Info: %s = %s", name, value), {}});
}

} // namespace peru
