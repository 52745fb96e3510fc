#include "peru/pipes/posix/PipeClient.h"

#include "peru/Errors.h"
#include "peru/pipes/posix/PipeFolder.h"
#include "peru/streams/StreamTools.h"

namespace peru::posix {

namespace {

constexpr int kBusyWait = 1000; // milliseconds

} // namespace

class CPipeClient::CInStream : public CObject, public IPipeInStream {
public:
    explicit CInStream(const P<CPipeSocket>& socket) : m_socket(socket) {}

    void close() override { m_socket->close(); }
    P<IURI> getURI() const override { return nullptr; }
    bool isAtEnd() override { return m_socket->isAtEnd(); }
    void read(void* buffer, int64_t size) override {
        checkStreamSize(size, "read");
        m_socket->read(static_cast<uint8_t*>(buffer), size);
    }
    int64_t readSome(void* buffer, int64_t size) override {
        checkStreamSize(size, "readSome");
        return m_socket->readSome(static_cast<uint8_t*>(buffer), size);
    }
    void skip(int64_t size) override {
        checkStreamSize(size, "skip");
        uint8_t bytes[4096];
        for (int64_t step; size > 0; size -= step) {
            step = std::min<int64_t>(size, sizeof bytes);
            m_socket->read(bytes, step);
        }
    }
    int64_t getAvailable() const override { return m_socket->getAvailable(); }
    bool waitForData(uint32_t milliseconds) override { return m_socket->waitForData(milliseconds); }
    EArrival fetch() override { return m_socket->fetch(); }
    void setDeadline(uint32_t milliseconds) override { m_socket->getReadWait().setDeadline(milliseconds); }
    void setExtension(const std::function<bool()>& extension) override {
        m_socket->getReadWait().setExtension(extension);
    }
    void abort() override { m_socket->getReadWait().abort(); }
    void resume() override { m_socket->getReadWait().resume(); }

private:
    P<CPipeSocket> m_socket;
};

class CPipeClient::COutStream : public CObject, public IPipeOutStream {
public:
    explicit COutStream(const P<CPipeSocket>& socket) : m_socket(socket) {}

    void close() override { m_socket->close(); }
    P<IURI> getURI() const override { return nullptr; }
    bool isAtEnd() override { return true; } // the position is always the end
    void write(const void* buffer, int64_t size) override {
        checkStreamSize(size, "write");
        const SPipePart part = {buffer, size};
        m_socket->write(&part, 1);
    }
    void flush() override {}
    bool writeByte(uint8_t value) override {
        try {
            write(&value, 1);
            return true;
        } catch (const CException&) {
            return false;
        }
    }
    void writeParts(const SPipePart* parts, size_t count) override {
        for (size_t i = 0; i < count; ++i) checkStreamSize(parts[i].size, "writeParts");
        m_socket->write(parts, count);
    }
    void setDeadline(uint32_t milliseconds) override { m_socket->getWriteWait().setDeadline(milliseconds); }
    void setExtension(const std::function<bool()>& extension) override {
        m_socket->getWriteWait().setExtension(extension);
    }
    void abort() override { m_socket->getWriteWait().abort(); }
    void resume() override { m_socket->getWriteWait().resume(); }

private:
    P<CPipeSocket> m_socket;
};

CPipeClient::CPipeClient(const P<IString>& name) : CPipeClient(name, make<CPipeSocket>()) {}

CPipeClient::CPipeClient(const P<IString>& name, const P<CPipeSocket>& socket)
    : m_name(name), m_socket(socket), m_in(make<CInStream>(socket)), m_out(make<COutStream>(socket)) {}

CPipeClient::~CPipeClient() {
    m_socket->close();
}

bool CPipeClient::connect() {
    if (m_socket->isAttached())
        throw CInvalidObjectStateError("the pipe was already connected", P<IBase>::share(this));
    CFileHandle socket = CPipeFolder::open().connect(CString::toStdString(m_name), kBusyWait);
    if (!socket.isOpen()) return false;
    m_socket->attach(std::move(socket));
    return true;
}

} // namespace peru::posix
