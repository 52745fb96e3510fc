// Arbitrary bytes as the requests of a peer and as its answers: every message ends with a value or a family
// error, and what is executed has all of its parameters.
#include "peru/Errors.h"
#include "peru/remote/RemoteStreamClient.h"
#include "peru/streams/MemoryIOStream.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>

using namespace peru;

namespace {

struct SRecord {
    int32_t number;
    double value;
};

void addVars(auto&& add) {
    add(make<CRemoteVarInteger>("i"));
    add(make<CRemoteVarInteger64>("l"));
    add(make<CRemoteVarString>("s"));
    add(make<CRemoteVarDouble>("d"));
    add(make<CRemoteVarBool>("b"));
    add(make<CRemoteVarURI>("u"));
    add(make<CRemoteVarStruct<SRecord>>("r"));
    const P<CRemoteVarObject> object = make<CRemoteVarObject>("o");
    object->setTarget(make<CMemoryBlock>());
    add(object);
}

class CEveryFunction : public CRemoteFunction {
public:
    CEveryFunction() : CRemoteFunction("f") {
        addVars([this](const P<CRemoteVar>& var) {
            addParam(var);
            addResult(var);
        });
    }
    void execute() override {
        const P<CRemoteVarObject> object(getParams().back());
        const P<CMemoryBlock> block = tryCast<CMemoryBlock>(object->getValue());
        if (block && block->getSize() > 1 << 20) std::abort(); // more than the input has
    }
};

class CPlainProc : public CRemoteVoid {
public:
    CPlainProc() : CRemoteVoid("p") {}
    void execute() override {}
};

P<CMemoryIOStream> makeStream(const uint8_t* data, size_t size) {
    const P<CMemoryBlock> block = make<CMemoryBlock>(static_cast<int64_t>(size));
    if (size > 0) std::memcpy(block->getData(), data, size);
    return make<CMemoryIOStream>(block);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const P<CMemoryIOStream> requests = makeStream(data, size);
    const P<CRemoteStreamClient> server = make<CRemoteStreamClient>(requests, make<CMemoryIOStream>());
    server->addProc(make<CEveryFunction>());
    server->addProc(make<CPlainProc>());
    while (!requests->isAtEnd()) {
        const int64_t before = requests->getPosition();
        try {
            server->processOne();
        } catch (const CException&) {
            if (requests->getPosition() == before) break;
        }
    }
    try {
        const P<CMemoryIOStream> requested = make<CMemoryIOStream>();
        make<CRemoteStreamClient>(makeStream(data, size), requested)->call(make<CEveryFunction>());
    } catch (const CException&) {
    }
    return 0;
}
