// One end of a pipe connection.
#pragma once

#include "peru/pipes/IPipeStreams.h"

namespace peru {

// Reading and writing may happen on two threads at the same time. The streams remain valid objects after the
// client is destroyed, which closes the pipe.
class PERU_API IPipeClient : public virtual IBase {
public:
    virtual P<IString> getName() const = 0; // the short name
    // Connects to the server of that name. While the server is busy with other clients, waits up to 1000 ms
    // for its next free connection. False if there is no server or none was free; may then be called again.
    // Throws CInvalidObjectStateError if the client is or was connected, CError without a private folder.
    virtual bool connect() = 0;
    // True until one of the ends closes the pipe; bytes of a peer that has closed it count as alive until
    // they are read.
    virtual bool isAlive() const = 0;
    // Closes the pipe; a thread that waits in one of the streams gets "Invalid pipe handle".
    virtual void close() = 0;
    virtual P<IPipeInStream> getInStream() const = 0;
    virtual P<IPipeOutStream> getOutStream() const = 0;
};

} // namespace peru
