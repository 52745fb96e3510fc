// A whole look-up.
#pragma once

#include "freedb/FreeDBQueryCommand.h"
#include "freedb/FreeDBReadCommand.h"
#include "freedb/IFreeDBHandler.h"

#include <mutex>

namespace freedb {

enum class EFreeDBState {
    start = 0,
    query = 1,
    evaluate = 2,
    select = 3,
    read = 4,
    finished = 5,
};

enum class EFreeDBOutcome { pending, found, noMatch, notChosen, failed };

// Driven by one thread, which polls or waits; cancel() may be called by any thread.
class FREEDB_API CFreeDBInfoRetriever : public peru::CObject {
public:
    // A disc that was read in several ways has several tables of contents: the next one is tried if the query
    // for one fails. The handler may be empty if no choice will be needed.
    CFreeDBInfoRetriever(const SFreeDBSettings& settings, std::vector<P<CFreeDBDiscInfo>> discs,
                         const P<IFreeDBHandler>& handler);
    ~CFreeDBInfoRetriever() override;

    // Returns whether the look-up has finished; with `wait` true always. Throws CError if there is a choice
    // and no handler; the look-up has then failed.
    bool advance(bool wait);
    EFreeDBState getState() const { return m_state; }
    size_t getAttemptCount() const { return m_attempts; }
    EFreeDBOutcome getOutcome() const { return m_outcome; }
    const P<CAudioCDInfo>& getInfo() const { return m_info; } // empty unless one was found
    // For the user; empty unless the look-up failed.
    const P<peru::IString>& getErrorMessage() const { return m_error; }
    void cancel();

private:
    bool runState(bool wait); // false if it has to wait
    void startQuery();
    void evaluate();
    void select();
    void startRead(size_t candidate);
    void finish(EFreeDBOutcome outcome, const P<peru::IString>& error = peru::CString::empty());
    void setCommand(const P<CFreeDBCommand>& command);

    SFreeDBSettings m_settings;
    std::vector<P<CFreeDBDiscInfo>> m_discs;
    P<IFreeDBHandler> m_handler;
    EFreeDBState m_state = EFreeDBState::start;
    EFreeDBOutcome m_outcome = EFreeDBOutcome::pending;
    size_t m_attempts = 0;
    P<CFreeDBQueryCommand> m_query;
    P<CFreeDBReadCommand> m_read;
    P<CAudioCDInfo> m_info;
    P<peru::IString> m_error = peru::CString::empty();
    std::mutex m_mutex; // guards the two members below
    P<CFreeDBCommand> m_command;
    bool m_isCancelled = false;
};

} // namespace freedb
