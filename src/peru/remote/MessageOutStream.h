// Gathers the small writes of a message.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/pipes/IPipeStreams.h"
#include "peru/uri/IURI.h"

namespace peru {

// Holds back what is written until flush(), so that a message leaves in one write. A large write is not
// copied: it leaves at once, together with what was held back.
class PERU_API CMessageOutStream : public CObject, public IOutStream {
public:
    explicit CMessageOutStream(const P<IOutStream>& target);
    ~CMessageOutStream() override;

    // Gathers up to the size of the block.
    void setBuffer(const P<IMemoryBlock>& block);
    // Forgets what is held back. Returns false if a part of the message has left already.
    bool discard();

    void close() override { m_target->close(); }
    P<IURI> getURI() const override { return m_target->getURI(); }
    bool isAtEnd() override { return m_target->isAtEnd(); }
    void write(const void* buffer, int64_t size) override;
    void flush() override; // ends the message

private:
    void send(const void* more, int64_t size);

    P<IOutStream> m_target;
    P<IPipeOutStream> m_pipe; // the target, if it is a pipe
    P<IMemoryBlock> m_block;
    int64_t m_held = 0;
    bool m_hasSent = false; // a part of the current message
};

} // namespace peru
