#include "freedb/FreeDBInfoRetriever.h"

#include "peru/Errors.h"
#include "peru/log/ILog.h"

namespace freedb {

CFreeDBInfoRetriever::CFreeDBInfoRetriever(const SFreeDBSettings& settings,
                                           std::vector<P<CFreeDBDiscInfo>> discs,
                                           const P<IFreeDBHandler>& handler)
    : m_settings(settings), m_discs(std::move(discs)), m_handler(handler) {
    if (m_discs.empty()) throw peru::CInvalidArgError("discs", "CFreeDBInfoRetriever");
}

CFreeDBInfoRetriever::~CFreeDBInfoRetriever() = default;

void CFreeDBInfoRetriever::cancel() {
    std::lock_guard lock(m_mutex);
    m_isCancelled = true;
    if (m_command) m_command->cancel();
}

void CFreeDBInfoRetriever::setCommand(const P<CFreeDBCommand>& command) {
    std::lock_guard lock(m_mutex);
    m_command = command;
    if (m_isCancelled) m_command->cancel();
}

bool CFreeDBInfoRetriever::advance(bool wait) {
    while (m_state != EFreeDBState::finished)
        if (!runState(wait)) return false;
    return true;
}

bool CFreeDBInfoRetriever::runState(bool wait) {
    switch (m_state) {
    case EFreeDBState::start:
        startQuery();
        return true;
    case EFreeDBState::query:
        if (!m_query->advance(wait)) return false;
        m_state = m_query->getResult() == EFreeDBResult::failed && !m_query->isCancelled() &&
                          m_attempts < m_discs.size()
                      ? EFreeDBState::start
                      : EFreeDBState::evaluate;
        return true;
    case EFreeDBState::evaluate:
        evaluate();
        return true;
    case EFreeDBState::select:
        select();
        return true;
    default:
        if (!m_read->advance(wait)) return false;
        m_info = m_read->getInfo();
        finish(m_info ? EFreeDBOutcome::found : EFreeDBOutcome::failed, m_read->getErrorMessage());
        return true;
    }
}

void CFreeDBInfoRetriever::startQuery() {
    m_query = peru::make<CFreeDBQueryCommand>(m_settings, *m_discs[m_attempts]); // throws for bad settings
    ++m_attempts;
    setCommand(m_query);
    m_state = EFreeDBState::query;
}

void CFreeDBInfoRetriever::evaluate() {
    switch (m_query->getResult()) {
    case EFreeDBResult::exact:
        if (m_query->getCandidates().size() == 1)
            startRead(0);
        else
            m_state = EFreeDBState::select;
        break;
    case EFreeDBResult::inexact:
        m_state = EFreeDBState::select;
        break;
    case EFreeDBResult::none:
        finish(EFreeDBOutcome::noMatch);
        break;
    default:
        finish(EFreeDBOutcome::failed, m_query->getErrorMessage());
    }
}

void CFreeDBInfoRetriever::select() {
    peru::getLogManager()->info(peru::CString::fromUTF8("freedb"),
                                "CFreeDBInfoRetriever: show select disc dialog");
    std::optional<size_t> chosen;
    try {
        if (!m_handler) throw peru::CError("No Handler defindes but needed");
        chosen =
            m_handler->chooseDisc(m_query->getCandidates(), m_query->getResult() == EFreeDBResult::exact);
    } catch (const peru::CException& error) {
        finish(EFreeDBOutcome::failed, error.getDescription());
        throw;
    }
    if (chosen && *chosen < m_query->getCandidates().size())
        startRead(*chosen);
    else
        finish(EFreeDBOutcome::notChosen);
}

void CFreeDBInfoRetriever::startRead(size_t candidate) {
    m_read = peru::make<CFreeDBReadCommand>(m_settings, *m_query->getCandidates()[candidate]);
    setCommand(m_read);
    m_state = EFreeDBState::read;
}

void CFreeDBInfoRetriever::finish(EFreeDBOutcome outcome, const P<peru::IString>& error) {
    m_outcome = outcome;
    m_error = error;
    m_state = EFreeDBState::finished;
}

} // namespace freedb
