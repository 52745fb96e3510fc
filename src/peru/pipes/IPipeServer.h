// The end of a pipe that others connect to.
#pragma once

#include "peru/pipes/IPipeClient.h"
#include "peru/pipes/PipeAccess.h"

namespace peru {

class IPipeServer;

// Called on the server's accept thread while the server's connections are locked. A listener may use the
// server, except for stop(), and must not wait for a thread that uses it.
class PERU_API IPipeServerListener : public virtual IBase {
public:
    virtual void onClientConnected(IPipeServer* server, const P<IPipeClient>& client) = 0;
    // The client has closed its end and all of its bytes were read.
    virtual void onClientDisconnected(IPipeServer* server, const P<IPipeClient>& client) = 0;
    // Bytes have arrived. Called again at once if the listener has read some but not all of them, otherwise
    // when more arrive.
    virtual void onData(IPipeServer* server, const P<IPipeClient>& client) = 0;
};

// Either serves any number of clients from a thread of its own (start, stop), or waits for a single client on
// the caller's thread (acceptOne). Thread-safe.
class PERU_API IPipeServer : public virtual IBase {
public:
    // The first pipe instance exists, so that a client can connect.
    class PERU_API IPipeCreatedListener : public virtual IBase {
    public:
        virtual void onPipeCreated(IPipeServer* server) = 0;
    };

    static constexpr size_t kMostClients = 255;

    virtual P<IString> getName() const = 0; // the short name

    // Starts accepting clients. Throws CException with "Error starting Pipe Server", among others if another
    // server uses the name, or with "Could not create DACL for Pipe Server"; the reason is in the log.
    virtual void start() = 0;
    // Ends start() and acceptOne() at once and closes all connections. The server can be started again.
    virtual void stop() = 0;
    // Waits for one client, until the deadline or stop(). Calls the listener, which may be null, when a
    // client can connect; its exceptions end the wait and propagate. Returns an empty handle if no client has
    // connected or the pipe could not be created; the reason is in the log.
    virtual P<IPipeClient> acceptOne(IPipeCreatedListener* listener) = 0;

    virtual size_t getClientCount() const = 0;
    virtual P<IPipeClient> getClient(size_t index) const = 0; // empty if there is no such client
    // True once a client is connected. False when the time is over or no more clients are accepted.
    virtual bool waitForClient(uint32_t milliseconds) = 0;
    // Writes to every client. Throws CException with "Error write to server clients. No clients connected.";
    // the error of a client is thrown after the others have got the bytes.
    virtual P<IOutStream> getOutStream() const = 0;

    // Listeners are held without a reference. One that also is an IPipeCreatedListener gets that call from
    // start(). removeListener returns once no call is in progress, unless it is called from within one.
    virtual void addListener(IPipeServerListener* listener) = 0;
    virtual bool removeListener(IPipeServerListener* listener) = 0;

    // The rules by which clients are accepted, in the order in which they are applied. By default
    // administrators may do everything and other users read and write. Used by the next start or acceptOne.
    virtual void setAccessRules(const CPipeAccessRules& rules) = 0;
    // How long start() and acceptOne() wait for a first client before they stop accepting; 0 means without
    // limit, which is the default.
    virtual void setDeadline(int64_t milliseconds) = 0;
};

} // namespace peru
