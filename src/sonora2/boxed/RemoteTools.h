// Shortens the declaration of remote procedures.
#pragma once

#include "peru/remote/RemoteProcs.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// A function whose result is a var of the given class.
template <class Var> class TRemoteFunction : public peru::CRemoteFunction {
public:
    const P<Var> result = addResult<Var>();

protected:
    explicit TRemoteFunction(const char* name) : CRemoteFunction(name) {}
};

// The serving end of a procedure: calls `body` with the procedure's own parameters and result.
template <class Proc, class Body> class TServedProc : public Proc {
public:
    explicit TServedProc(Body body) : m_body(std::move(body)) {}
    void execute() override { m_body(static_cast<Proc&>(*this)); }

private:
    Body m_body;
};

template <class Proc, class Body> P<peru::CRemoteProc> serveProc(Body body) {
    return peru::make<TServedProc<Proc, Body>>(std::move(body));
}

} // namespace sonora2::common
