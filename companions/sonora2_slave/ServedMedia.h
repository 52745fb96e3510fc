// The serving end of sources and formats.
#pragma once

#include "peru/Errors.h"
#include "peru/remote/RemoteStreamClient.h"
#include "sonora2/boxed/RemoteMediaState.h"
#include "sonora2/boxed/RemoteTools.h"
#include "sonora2/media/IFormat.h"
#include "sonora2/media/ISource.h"
#include "sonora2_slave/CrashDetails.h"
#include "sonora2_slave/SlaveLog.h"

namespace slave {

// Errors of procedures without an answer, until the host asks. Used by the serving thread only.
class CFailures : public peru::CObject {
public:
    void keep(const peru::CException& exception);
    P<peru::IString> take();
    bool isEmpty() const { return !m_first; }

private:
    P<peru::IString> m_first;
};

// Runs what a procedure executes. Exceptions that are unknown to the layer of remote calls become a CError.
template <class Body> void guarded(const char* operation, const Body& body) {
    const CCrashDetails::CCall call(operation);
    try {
        body();
    } catch (const peru::CException&) {
        throw;
    } catch (const std::exception&) {
        throw;
    } catch (...) {
        throw peru::CError("unknown exception");
    }
}

// Offers a procedure with an answer. The body gets the procedure.
template <class Proc, class Body> void addFunction(peru::IRemote& remote, const char* operation, Body body) {
    remote.addProc(sonora2::common::serveProc<Proc>(
        [operation, body](Proc& proc) { guarded(operation, [&] { body(proc); }); }));
}

// A procedure without one, whose errors are kept. Until the host has seen one, nothing else is executed: a
// caller in the same process would not have gone on either, such as closing a file with a part missing.
template <class Proc, class Body>
P<peru::CRemoteProc> serveVoid(const P<CFailures>& failures, const char* operation, Body body) {
    return sonora2::common::serveProc<Proc>([operation, failures, body](Proc& proc) {
        if (!failures->isEmpty()) return;
        try {
            guarded(operation, [&] { body(proc); });
        } catch (const peru::CException& exception) {
            failures->keep(exception);
        } catch (const std::exception& exception) {
            failures->keep(peru::CError(exception.what()));
        }
    });
}

template <class Proc, class Body>
void addVoid(peru::IRemote& remote, const P<CFailures>& failures, const char* operation, Body body) {
    remote.addProc(serveVoid<Proc>(failures, operation, body));
}

// Replace the procedures of an earlier source or format.
void serveSource(peru::IRemote& remote, const P<sonora2::common::ISource>& source,
                 const P<peru::IMemoryManager>& memory, const P<CSlaveLog>& log);
void serveFormat(peru::IRemote& remote, const P<sonora2::common::IFormat>& format,
                 const P<peru::IMemoryManager>& memory, const P<CSlaveLog>& log);

} // namespace slave
