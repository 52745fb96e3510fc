// One command to a CDDB server.
#pragma once

#include "freedb/Api.h"
#include "freedb/FreeDBCache.h"
#include "freedb/FreeDBReply.h"
#include "freedb/FreeDBSettings.h"
#include "peru/net/HTTPOperation.h"

#include <string>

namespace freedb {

// Driven by one thread at a time, which polls or waits; cancel() may be called by any thread and ends a
// waiting call at once. A command that fails does not throw: it has the result EFreeDBResult::failed and a
// message.
class FREEDB_API CFreeDBCommand : public peru::CObject {
public:
    ~CFreeDBCommand() override;

    // Returns whether the command is done; with `wait` true always.
    bool advance(bool wait);
    EFreeDBResult getResult() const { return m_result; }
    // For the user; empty unless the result is EFreeDBResult::failed.
    const P<peru::IString>& getErrorMessage() const { return m_error; }
    const std::string& getReplyText() const { return m_reply; } // as received
    bool isFromCache() const { return m_fromCache; }
    void cancel();
    bool isCancelled() const;

protected:
    // `command` is the first field of the request, encoded; `entry` names it in the cache. Throws
    // CInvalidArgError for settings without a host or a client, and CURIError for an invalid host.
    CFreeDBCommand(const SFreeDBSettings& settings, const std::string& command, const std::string& entry);

    // Throws CError for a reply that reports a failure or cannot be understood.
    virtual EFreeDBResult evaluate(const std::string& reply, const CTextDecoder& decoder) = 0;
    // Encodes text for a field of a command, in which blanks would separate words.
    static std::string encode(const std::string& text);

private:
    class CSteps;

    void takeFromCache();
    bool exchange(bool wait);
    void finish(const SCachedReply& reply);
    void fail(const P<peru::IString>& message);

    SFreeDBSettings m_settings;
    std::string m_command;
    std::string m_entry;
    std::string m_server;
    P<CFreeDBCache> m_cache; // empty: none
    P<CSteps> m_steps;       // outlives the operation, which does not count it
    P<peru::net::CHTTPOperation> m_operation;
    bool m_triedCache = false;
    bool m_fromCache = false;
    EFreeDBResult m_result = EFreeDBResult::pending;
    std::string m_received; // so far
    std::string m_reply;
    P<peru::IString> m_error = peru::CString::empty();
};

} // namespace freedb
