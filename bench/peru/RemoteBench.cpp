// A remote call over a pipe compared with the same bytes over a bare pair of sockets in the same run, and the
// transfer of blocks.
#include "peru/pipes/IPipeManager.h"
#include "peru/remote/RemoteStreamClient.h"

#include <benchmark/benchmark.h>

#include <sys/socket.h>
#include <thread>
#include <unistd.h>

using namespace peru;

namespace {

class CNextFunction : public CRemoteFunction {
public:
    CNextFunction() : CRemoteFunction("next") {}
    void execute() override { result->setValue(number->getValue() + 1); }

    const P<CRemoteVarInteger> number = addParam<CRemoteVarInteger>("number");
    const P<CRemoteVarInteger> result = addResult<CRemoteVarInteger>();
};

// Reads into memory that is there already.
class CBlock : public CObject, public ISerializable {
public:
    explicit CBlock(size_t size) : m_bytes(size) {}
    void writeTo(const P<IDataOutStream>& stream) const override {
        stream->write(m_bytes.data(), static_cast<int64_t>(m_bytes.size()));
    }
    void readFrom(const P<IDataInStream>& stream) override {
        stream->read(m_bytes.data(), static_cast<int64_t>(m_bytes.size()));
    }

private:
    std::vector<uint8_t> m_bytes;
};

class CTakeFunction : public CRemoteFunction {
public:
    explicit CTakeFunction(size_t size) : CRemoteFunction("take") {
        const P<CBlock> block = make<CBlock>(size);
        m_block->setValue(block);
        m_block->setTarget(block);
    }
    void execute() override {}

private:
    P<CRemoteVarObject> m_block = addParam<CRemoteVarObject>("block");
    P<CRemoteVarBool> m_result = addResult<CRemoteVarBool>();
};

class CConnection : public CObject, public IPipeServer::IPipeCreatedListener {
public:
    CConnection() {
        const P<IString> name = newString("benchmark-") + std::to_string(::getpid()).c_str();
        m_server = getPipeManager()->createServer(name);
        m_client = getPipeManager()->createClient(name);
        m_accepted = m_server->acceptOne(this);
        served = make<CRemoteStreamClient>(m_accepted->getInStream(), m_accepted->getOutStream());
        calling = make<CRemoteStreamClient>(m_client->getInStream(), m_client->getOutStream());
    }
    void onPipeCreated(IPipeServer*) override { m_client->connect(); }

    P<CRemoteStreamClient> served;
    P<CRemoteStreamClient> calling;

private:
    P<IPipeServer> m_server;
    P<IPipeClient> m_client;
    P<IPipeClient> m_accepted;
};

// The sizes of a request and of its answer.
constexpr size_t kRequest = 12 + 8 + 10 + 4 + 11;
constexpr size_t kAnswer = 10 + 10 + 4;

void BM_RoundTrip_sockets(benchmark::State& state) {
    int ends[2];
    if (::socketpair(AF_UNIX, SOCK_STREAM, 0, ends) != 0) return state.SkipWithError("no sockets");
    std::thread server([&] {
        char bytes[kRequest] = {};
        while (::recv(ends[1], bytes, sizeof bytes, MSG_WAITALL) == ssize_t(sizeof bytes))
            if (::send(ends[1], bytes, kAnswer, MSG_NOSIGNAL) < 0) break;
    });
    char bytes[kRequest] = {};
    for (auto _ : state) {
        benchmark::DoNotOptimize(::send(ends[0], bytes, kRequest, 0));
        benchmark::DoNotOptimize(::recv(ends[0], bytes, kAnswer, MSG_WAITALL));
    }
    ::shutdown(ends[0], SHUT_RDWR);
    server.join();
    for (const int end : ends) ::close(end);
}

void BM_RoundTrip_remote(benchmark::State& state) {
    const P<CConnection> connection = make<CConnection>();
    connection->served->addProc(make<CNextFunction>());
    connection->served->startWorkInThread(10);
    const P<CNextFunction> next = make<CNextFunction>();
    for (auto _ : state) next->number->setValue(connection->calling->callReturningInt(next));
}

void BM_Block_sockets(benchmark::State& state) {
    int ends[2];
    if (::socketpair(AF_UNIX, SOCK_STREAM, 0, ends) != 0) return state.SkipWithError("no sockets");
    std::vector<uint8_t> bytes(static_cast<size_t>(state.range(0)));
    std::thread server([&] {
        std::vector<uint8_t> copy(bytes.size());
        while (::recv(ends[1], copy.data(), copy.size(), MSG_WAITALL) == ssize_t(copy.size()))
            if (::send(ends[1], copy.data(), kAnswer, MSG_NOSIGNAL) < 0) break;
    });
    char answer[kAnswer];
    for (auto _ : state) {
        benchmark::DoNotOptimize(::send(ends[0], bytes.data(), bytes.size(), 0));
        benchmark::DoNotOptimize(::recv(ends[0], answer, kAnswer, MSG_WAITALL));
    }
    state.SetBytesProcessed(state.iterations() * state.range(0));
    ::shutdown(ends[0], SHUT_RDWR);
    server.join();
    for (const int end : ends) ::close(end);
}

void BM_Block_remote(benchmark::State& state) {
    const auto size = static_cast<size_t>(state.range(0));
    const P<CConnection> connection = make<CConnection>();
    connection->served->addProc(make<CTakeFunction>(size));
    connection->served->startWorkInThread(10);
    const P<CTakeFunction> take = make<CTakeFunction>(size);
    for (auto _ : state) connection->calling->call(take);
    state.SetBytesProcessed(state.iterations() * state.range(0));
}

BENCHMARK(BM_RoundTrip_sockets)->UseRealTime();
BENCHMARK(BM_RoundTrip_remote)->UseRealTime();
BENCHMARK(BM_Block_sockets)->Arg(1 << 20)->UseRealTime();
BENCHMARK(BM_Block_remote)->Arg(1 << 20)->UseRealTime();

} // namespace
