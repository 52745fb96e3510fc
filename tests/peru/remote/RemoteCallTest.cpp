#include "peru/pipes/PipeSupport.h"
#include "peru/remote/RemoteException.h"
#include "peru/remote/RemoteStreamClient.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/HexData.h"
#include "peru/uri/URI.h"

#include <atomic>
#include <memory>
#include <stdexcept>

namespace {

using namespace peru;
using tests::CRawSocket;
using tests::errorOf;
using tests::text;
using tests::titleOf;

constexpr uint32_t kHang = 30000; // milliseconds after which something hangs

// A string in its wire form: the size and the bytes.
std::string wire(const std::string& text) {
    const auto size = static_cast<uint32_t>(text.size());
    std::string bytes;
    for (int shift = 0; shift < 32; shift += 8) bytes += static_cast<char>(size >> shift);
    return bytes + text;
}

std::string hex(const std::string& digits) {
    const std::vector<uint8_t> bytes = parseHexData(CString::fromUTF8(digits));
    return {bytes.begin(), bytes.end()};
}

P<CMemoryIOStream> memory(const std::string& bytes = {}) {
    const P<CMemoryIOStream> stream = make<CMemoryIOStream>();
    stream->write(bytes.data(), static_cast<int64_t>(bytes.size()));
    stream->reset();
    return stream;
}

std::string bytesOf(const P<CMemoryIOStream>& stream) {
    return {reinterpret_cast<const char*>(stream->getBlock()->getData()),
            static_cast<size_t>(stream->getSize())};
}

struct SRecord {
    int32_t a;
    float b;
};

class CShort : public CObject, public ISerializable {
public:
    explicit CShort(int16_t value = 0) : m_value(value) {}
    void writeTo(const P<IDataOutStream>& stream) const override { stream->writeInt16(m_value); }
    void readFrom(const P<IDataInStream>& stream) override { m_value = stream->readInt16(); }
    int16_t m_value;
};

// Adds its two numbers; 6 and 7 are an error.
class CAddFunction : public CRemoteFunction {
public:
    CAddFunction(int32_t a = 0, int32_t b = 0) : CRemoteFunction("add") {
        m_a->setValue(a);
        m_b->setValue(b);
    }
    void execute() override {
        const int32_t sum = m_a->getValue() + m_b->getValue();
        if (m_a->getValue() == 6 && m_b->getValue() == 7) throw CError("unlucky");
        m_result->setValue(sum);
    }

private:
    P<CRemoteVarInteger> m_a = addParam<CRemoteVarInteger>("a");
    P<CRemoteVarInteger> m_b = addParam<CRemoteVarInteger>("b");
    P<CRemoteVarInteger> m_result = addResult<CRemoteVarInteger>();
};

class CCallProc : public CRemoteVoid {
public:
    CCallProc(const char* name, std::function<void()> action = {})
        : CRemoteVoid(name), m_action(std::move(action)) {}
    void execute() override { m_action(); }

private:
    std::function<void()> m_action;
};

// Returns the object that it is given.
class CEchoFunction : public CRemoteFunction {
public:
    explicit CEchoFunction(const P<ISerializable>& object = make<CMemoryBlock>()) : CRemoteFunction("echo") {
        m_param->setValue(object);
        m_param->setTarget(object);
    }
    void execute() override { m_result->setValue(m_param->getValue()); }

private:
    P<CRemoteVarObject> m_param = addParam<CRemoteVarObject>("object");
    P<CRemoteVarObject> m_result = addResult<CRemoteVarObject>();
};

// Functions, since objects of the library are not available before main().
std::string addRequest() {
    return wire("function") + wire("add") + wire("a") + hex("05000000") + wire("b") + hex("FEFFFFFF") +
           wire("execute");
}
std::string addAnswer() {
    return wire("return") + wire("Result") + hex("03000000");
}

TEST(RemoteVar, HasItsWireForm) {
    const P<CRemoteVarObject> object = make<CRemoteVarObject>("o", make<CShort>(int16_t{7}));
    object->setTarget(make<CShort>());
    const struct {
        P<CRemoteVar> var;
        const char* bytes;
    } cases[] = {
        {make<CRemoteVarInteger>("n", -2), "01000000 6E FEFFFFFF"},
        {make<CRemoteVarInteger64>("n", int64_t{1} << 40), "01000000 6E 0000000000010000"},
        {make<CRemoteVarString>("s", newString("a\xE4")), "01000000 73 03000000 61C3A4"},
        {make<CRemoteVarDouble>("d", -2.0), "01000000 64 00000000000000C0"},
        {make<CRemoteVarBool>("b", true), "01000000 62 01"},
        {make<CRemoteVarURI>("u"), "01000000 75 01"},
        {make<CRemoteVarURI>("u", P<IURI>(make<CURI>("a:b"))), "01000000 75 00 03000000 613A62"},
        {object, "01000000 6F 00 0700 40E20100"},
        {make<CRemoteVarObject>("o"), "01000000 6F 01"},
        {make<CRemoteVarStruct<SRecord>>("r", SRecord{5, 1.0f}), "01000000 72 08000000 05000000 0000803F"},
    };
    for (const auto& each : cases) {
        std::string digits = each.bytes;
        std::erase(digits, ' ');
        const P<CMemoryIOStream> out = memory();
        each.var->writeTo(make<CDataOutStream>(out));
        EXPECT_EQ(bytesOf(out), hex(digits)) << each.bytes;
        // Reads its own form back, ...
        out->reset();
        each.var->readFrom(make<CDataInStream>(out));
        EXPECT_TRUE(out->isAtEnd()) << each.bytes;
        const P<CMemoryIOStream> again = memory();
        each.var->writeTo(make<CDataOutStream>(again));
        EXPECT_EQ(bytesOf(again), hex(digits)) << each.bytes;
        // ... and nothing that was cut short.
        const P<CMemoryIOStream> cut = memory(hex(digits.substr(0, digits.size() - 2)));
        EXPECT_THROW(each.var->readFrom(make<CDataInStream>(cut)), CException) << each.bytes;
    }
}

TEST(RemoteVar, RefusesWhatItDoesNotExpect) {
    const auto refusal = [](const P<CRemoteVar>& var, const std::string& bytes, int64_t rest) {
        const P<CMemoryIOStream> in = memory(bytes);
        const std::string title = titleOf<CRemoteException>([&] { var->readFrom(make<CDataInStream>(in)); });
        EXPECT_EQ(in->getSize() - in->getPosition(), rest) << "unread";
        return title;
    };
    const P<CRemoteVar> number = make<CRemoteVarInteger>("n");
    EXPECT_EQ(refusal(number, wire("m") + "1234", 4), "Parameter not expected");
    EXPECT_EQ(refusal(number, wire("nn") + "1234", 6), "Parameter not expected");
    EXPECT_EQ(refusal(number, hex("FFFFFFFF") + "n", 1), "Parameter not expected");
    const P<CRemoteVar> record = make<CRemoteVarStruct<SRecord>>("r");
    EXPECT_EQ(refusal(record, wire("r") + hex("09000000") + "123456789", 9),
              "CRemoveVarStruct: size of struct is different");
}

TEST(RemoteCall, WritesTheRequestAndReadsTheAnswer) {
    const P<CMemoryIOStream> out = memory();
    const P<CRemoteStreamClient> client = make<CRemoteStreamClient>(memory(addAnswer()), out);
    EXPECT_EQ(client->callReturningInt(make<CAddFunction>(5, -2)), 3);
    EXPECT_EQ(bytesOf(out), addRequest());

    const P<CMemoryIOStream> quit = memory();
    make<CRemoteStreamClient>(memory(), quit)->quit(); // waits for no answer
    EXPECT_EQ(bytesOf(quit), wire("void") + wire("Quit") + wire("execute"));
    EXPECT_THROW(client->callReturningString(make<CAddFunction>()), CCastError);
    EXPECT_EQ(bytesOf(out), addRequest()) << "nothing is called";
}

TEST(RemoteCall, NamesWhatIsWrongWithTheAnswer) {
    const struct {
        std::string answer;
        const char* title;
    } cases[] = {
        {wire("notfound"), "Remote Procedure not found on host: add"},
        {wire("An Error: code 7"), "An Error: code 7"},
        {wire("function"), "Unexpected return received: function"},
        {"", "Unexpected return received: "},
        {wire("return") + wire("Other") + hex("03000000"), "Parameter not expected"},
    };
    for (const auto& each : cases) {
        const P<CRemoteStreamClient> client = make<CRemoteStreamClient>(memory(each.answer), memory());
        EXPECT_EQ(titleOf<CRemoteException>([&] { client->call(make<CAddFunction>()); }), each.title);
    }
}

TEST(RemoteCall, ServesOneMessageAtATime) {
    struct SCase {
        std::string request;
        bool isServed;
        std::string answer;
    };
    int calls = 0;
    const std::string addAndMore = addRequest().substr(0, addRequest().size() - wire("execute").size());
    const SCase cases[] = {
        {addRequest(), true, addAnswer()},
        {addAndMore, true, addAnswer()},
        {wire("void") + wire("note") + wire("execute"), true, ""},
        {wire("execute"), false, ""},
        {wire(""), false, ""},
        {"", false, ""},
        {wire("function") + wire("missing"), false, wire("notfound")},
        {wire("function") + wire("note"), false, wire("notfound")}, // not a function
    };
    for (const SCase& each : cases) {
        const P<CMemoryIOStream> out = memory();
        const P<CRemoteStreamClient> server = make<CRemoteStreamClient>(memory(each.request), out);
        server->addProc(make<CAddFunction>());
        server->addProc(make<CCallProc>("note", [&] { ++calls; }));
        EXPECT_EQ(server->processOne(), each.isServed) << each.request;
        EXPECT_EQ(bytesOf(out), each.answer) << each.request;
        EXPECT_FALSE(server->processOne()) << "the closing word is dropped";
    }
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(titleOf<CRemoteException>([] {
                  make<CRemoteStreamClient>(memory(wire("void") + wire("missing")), memory())->processOne();
              }),
              "Remote Procedure not found on this computer");
    EXPECT_EQ(titleOf<CRemoteException>(
                  [] { make<CRemoteStreamClient>(memory(), memory())->startWorkInThread(1); }),
              "Work in Thread only possible with named Pipe Streams");
}

// Two ends over a pipe; the accepted end serves.
class RemotePipe : public tests::CPipeTest {
protected:
    RemotePipe() { m_served->addProc(make<CAddFunction>()); }

    static int32_t add(const P<CRemoteStreamClient>& client, int32_t a, int32_t b) {
        return client->callReturningInt(make<CAddFunction>(a, b));
    }

    SPair m_pair = connect();
    P<CRemoteStreamClient> m_served =
        make<CRemoteStreamClient>(m_pair.accepted->getInStream(), m_pair.accepted->getOutStream());
    P<CRemoteStreamClient> m_calling =
        make<CRemoteStreamClient>(m_pair.client->getInStream(), m_pair.client->getOutStream());
};

TEST_F(RemotePipe, ThreadsCallWhileTheirOwnEndStartsAndStopsServing) {
    m_served->startWorkInThread(10);
    EXPECT_THROW(m_served->startWorkInThread(10), CInvalidObjectStateError);
    std::atomic<int> right{0}, left{8};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 8; ++thread)
        threads.emplace_back([&, thread] {
            for (int i = 0; i < 60; ++i) right += add(m_calling, 1000 * thread, i) == 1000 * thread + i;
            --left;
        });
    while (left > 0) {
        m_calling->startWorkInThread(1);
        m_calling->stopWorkInThread();
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(right, 480);
    EXPECT_FALSE(m_served->waitForWorkEnd(0));
    m_calling->quit();
    EXPECT_TRUE(m_served->waitForWorkEnd(kHang));
    // A procedure may stop its own thread.
    m_served->addProc(make<CCallProc>("stop", [this] { m_served->stopWorkInThread(); }));
    m_served->startWorkInThread(10);
    EXPECT_EQ(add(m_calling, 1, 2), 3);
    m_calling->call(make<CCallProc>("stop"));
    EXPECT_TRUE(m_served->waitForWorkEnd(kHang));
}

TEST_F(RemotePipe, ErrorsOfAProcedureLeaveTheConnectionUsable) {
    class CMissingFunction : public CRemoteFunction {
    public:
        CMissingFunction() : CRemoteFunction("missing") {}
    };
    m_served->addProc(make<CCallProc>("fail", [] { throw std::runtime_error("stays there"); }));
    m_served->startWorkInThread(10);
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(titleOf<CRemoteException>([&] { add(m_calling, 6, 7); }), "Error: unlucky");
        m_calling->call(make<CCallProc>("fail"));
        m_calling->call(make<CCallProc>("missing"));
        EXPECT_EQ(titleOf<CRemoteException>([&] { m_calling->call(make<CMissingFunction>()); }),
                  "Remote Procedure not found on host: missing");
        EXPECT_EQ(add(m_calling, i, 1), i + 1);
    }
    // Parameters that the other end has not read would be taken for messages.
    EXPECT_EQ(titleOf<CRemoteException>([&] { m_calling->call(make<CEchoFunction>()); }),
              "Remote Procedure not found on host: echo");
    EXPECT_EQ(titleOf([&] { add(m_calling, 1, 1); }), "Invalid pipe handle");
}

TEST(RemoteCall, AnUnwritableValueLeavesNothingBehind) {
    class CUnwritable : public CShort {
        void writeTo(const P<IDataOutStream>&) const override { throw CError("unwritable"); }
    };
    class CHalfFunction : public CRemoteFunction {
    public:
        CHalfFunction() : CRemoteFunction("half") {
            addParam<CRemoteVarObject>("o")->setValue(make<CUnwritable>());
        }
    };
    const P<CMemoryIOStream> out = memory();
    const P<CRemoteStreamClient> client = make<CRemoteStreamClient>(memory(addAnswer()), out);
    EXPECT_EQ(errorOf([&] { client->call(make<CHalfFunction>()); }), "unwritable");
    client->call(make<CAddFunction>(5, -2));
    EXPECT_EQ(bytesOf(out), addRequest());
}

TEST_F(RemotePipe, BothEndsCallInTurn) {
    m_calling->addProc(make<CAddFunction>());
    m_calling->startWorkInThread(1);
    m_served->startWorkInThread(1);
    for (int i = 0; i < 200; ++i) {
        EXPECT_EQ(add(m_calling, i, 1), i + 1);
        EXPECT_EQ(add(m_served, i, 2), i + 2);
    }
}

TEST_F(RemotePipe, BlocksOfAnySizePass) {
    m_served->addProc(make<CEchoFunction>());
    m_served->startWorkInThread(10);
    for (const bool gathers : {false, true}) {
        if (gathers) m_calling->setTempBlock(make<CMemoryManager>());
        for (const int64_t size : {0, 1, 8191, 8192, 16384, 1 << 20, 5'000'001}) {
            const P<CMemoryBlock> block = make<CMemoryBlock>(size);
            for (int64_t i = 0; i < size; ++i) block->getData()[i] = static_cast<uint8_t>(i * 7 + i / 251);
            const P<CMemoryBlock> copy = make<CMemoryBlock>();
            m_calling->callReturningObject(make<CEchoFunction>(block), copy);
            ASSERT_EQ(copy->getSize(), size);
            EXPECT_EQ(std::memcmp(copy->getData(), block->getData(), size_t(size)), 0) << size;
        }
    }
}

TEST_F(RemotePipe, ServingEndsWithThePipe) {
    class CListener : public CObject, public IRemoteListener {
    public:
        void onWorkEnded(IRemote*, const CException* error) override {
            m_error = error ? text(error->getTitle()) : "none";
        }
        std::string m_error;
    };
    const P<CListener> listener = make<CListener>();
    m_served->setListener(listener.get());
    m_served->startWorkInThread(10);
    m_pair.client->close();
    EXPECT_TRUE(m_served->waitForWorkEnd(kHang));
    EXPECT_EQ(listener->m_error, "none");
    EXPECT_EQ(titleOf([&] { add(m_calling, 1, 1); }), "Invalid pipe handle");
}

// A peer that is not ours at the other end.
class RemotePeer : public tests::CPipeTest {
protected:
    RemotePeer() {
        std::unique_ptr<CRawSocket>& peer = m_peer;
        const auto created =
            make<tests::CCreatedListener>([this, &peer] { peer = std::make_unique<CRawSocket>(path()); });
        m_end = m_server->acceptOne(created.get());
        m_remote = make<CRemoteStreamClient>(m_end->getInStream(), m_end->getOutStream());
        m_remote->addProc(make<CAddFunction>());
    }

    P<IPipeServer> m_server = server();
    std::unique_ptr<CRawSocket> m_peer;
    P<IPipeClient> m_end;
    P<CRemoteStreamClient> m_remote;
};

TEST_F(RemotePeer, MessagesLeaveInOneWriteAndArriveInPieces) {
    std::thread caller([&] { EXPECT_EQ(m_remote->callReturningInt(make<CAddFunction>(5, -2)), 3); });
    EXPECT_EQ(m_peer->receive(), addRequest());
    m_peer->send(addAnswer());
    caller.join();
    m_remote->startWorkInThread(10);
    for (const char byte : addRequest()) m_peer->send(std::string(1, byte)); // arrives in pieces
    EXPECT_EQ(m_peer->receive(), addAnswer());
    // Stopped while a procedure runs, it can serve again.
    std::atomic<bool> isRunning{false};
    m_remote->addProc(make<CCallProc>("slow", [&isRunning] {
        isRunning = true;
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }));
    m_peer->send(wire("void") + wire("slow") + wire("execute"));
    while (!isRunning) std::this_thread::yield();
    m_remote->stopWorkInThread();
    m_remote->startWorkInThread(10);
    m_peer->send(addRequest().substr(0, 20));
    std::this_thread::sleep_for(std::chrono::milliseconds(50)); // so that the other end waits
    m_peer->send(addRequest().substr(20));
    EXPECT_EQ(m_peer->receive(), addAnswer());
}

TEST_F(RemotePeer, SilenceEndsWithTheDeadline) {
    m_remote->setDeadline(50);
    EXPECT_EQ(titleOf([&] { m_remote->call(make<CAddFunction>()); }),
              "The deadline for reading from the pipe has passed");
    // A late answer must not be taken for that of the next call.
    EXPECT_EQ(titleOf([&] { m_remote->call(make<CAddFunction>()); }), "Invalid pipe handle");
}

// Of a size above the limit nothing is read and nothing allocated, even if all of it would arrive.
TEST_F(RemotePeer, MessagesAreLimited) {
    m_remote->setLimits(37, 8); // the request without its last word, and the longest text in it
    for (int i = 0; i < 3; ++i) {
        m_peer->send(addRequest());
        EXPECT_TRUE(m_remote->processOne());
        EXPECT_FALSE(m_remote->processOne()); // the last word of the request
        EXPECT_EQ(m_peer->receive(), addAnswer());
    }
    m_peer->send(wire("return") + wire("Result") + hex("00FFFFFF7F"));
    const P<CMemoryBlock> block = make<CMemoryBlock>();
    const P<CEchoFunction> echo = make<CEchoFunction>();
    EXPECT_EQ(titleOf([&] { m_remote->callReturningObject(echo, block); }),
              "The other process has sent more than the 37 bytes that are allowed.");
    EXPECT_EQ(titleOf([&] { m_remote->call(make<CAddFunction>()); }), "Invalid pipe handle");
}

TEST_F(RemotePeer, TextsAreLimited) {
    m_remote->setLimits(0, 100);
    m_peer->send(hex("65000000")); // the first word of an answer
    EXPECT_EQ(titleOf([&] { m_remote->call(make<CAddFunction>()); }),
              "The other process has sent more than the 100 bytes that are allowed.");
}

TEST_F(RemotePeer, APeerThatDiesDuringACallIsReportedAsSuch) {
    std::thread caller([&] {
        EXPECT_EQ(errorOf<CFinishedError>([&] { m_remote->call(make<CAddFunction>()); }), "Pipe was closed");
    });
    m_peer->receive();
    m_peer = nullptr;
    caller.join();
}

TEST_F(RemotePeer, UnreadableMessagesEndTheConnection) {
    m_remote->startWorkInThread(10);
    m_peer->send(wire("function") + wire("add") + wire("x"));
    EXPECT_EQ(m_peer->receive(), wire("Error: Parameter not expected"));
    EXPECT_EQ(m_peer->receive(), "");
    EXPECT_TRUE(m_remote->waitForWorkEnd(kHang));
}

TEST_F(RemotePeer, HalfAMessageStopsNobody) {
    class CAnnounced : public CShort {
    public:
        void readFrom(const P<IDataInStream>& stream) override {
            m_isReading = true;
            CShort::readFrom(stream);
        }
        std::atomic<bool> m_isReading{false};
    };
    const P<CAnnounced> half = make<CAnnounced>();
    m_remote->addProc(make<CEchoFunction>(half));
    m_remote->startWorkInThread(1000);
    m_peer->send(wire("function") + wire("echo") + wire("object") + hex("0001"));
    while (!half->m_isReading) std::this_thread::yield();
    m_remote->stopWorkInThread();
    EXPECT_EQ(m_peer->receive(), wire("Error: Read was aborted"));
    EXPECT_EQ(m_peer->receive(), "");
}

} // namespace
