#include "peru/remote/RemoteProcs.h"

#include "peru/Errors.h"

namespace peru {

CRemoteProc::CRemoteProc(const CStringArg& name)
    : m_name(CString::fromUTF8(CString::toStdString(name))->toUTF8String()) {}

CRemoteProc::~CRemoteProc() = default;

void CRemoteProc::execute() {
    throw CMethodNotImplementedError("execute", P<IBase>::share(this));
}

CRemoteVoid::CRemoteVoid(const CStringArg& name) : CRemoteProc(name) {}

CRemoteVoid::~CRemoteVoid() = default;

CRemoteFunction::CRemoteFunction(const CStringArg& name) : CRemoteProc(name) {}

CRemoteFunction::~CRemoteFunction() = default;

P<CRemoteVar> CRemoteFunction::getResult() const {
    for (const P<CRemoteVar>& var : m_results)
        if (var->getName()->equals("Result")) return var;
    throw CNoSuchObjectError();
}

} // namespace peru
