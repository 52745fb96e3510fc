// Named procedures that one end of a connection calls and the other end executes.
#pragma once

#include "peru/remote/RemoteVars.h"

#include <vector>

namespace peru {

// A concrete class adds its parameters in its constructor, in the order in which they are sent. The caller
// fills them in and passes the object to IRemote::call. The serving end derives a class that holds the real
// object and overrides execute(), which reads the parameters, calls the object and sets the result.
class PERU_API CRemoteProc : public CObject {
public:
    virtual bool isVoid() const = 0;
    // Called on the serving end with the parameters read, on the thread that serves. What it throws reaches
    // the caller as text if the procedure is a function.
    virtual void execute();

    const P<IString>& getName() const { return m_name; }
    const std::vector<P<CRemoteVar>>& getParams() const { return m_params; }

protected:
    explicit CRemoteProc(const CStringArg& name);
    ~CRemoteProc() override;

    void addParam(const P<CRemoteVar>& var) { m_params.push_back(var); }
    // Creates a var, adds it and returns it.
    template <class Var> P<Var> addParam(const CStringArg& name) {
        P<Var> var = make<Var>(name);
        m_params.push_back(var);
        return var;
    }

private:
    P<IString> m_name;
    std::vector<P<CRemoteVar>> m_params;
};

// A procedure without an answer: a call returns once the request is sent, and an error on the other side
// stays there.
class PERU_API CRemoteVoid : public CRemoteProc {
public:
    bool isVoid() const override { return true; }

protected:
    explicit CRemoteVoid(const CStringArg& name);
    ~CRemoteVoid() override;
};

// A procedure with an answer, in general one var with the name "Result".
class PERU_API CRemoteFunction : public CRemoteProc {
public:
    bool isVoid() const override { return false; }

    const std::vector<P<CRemoteVar>>& getResults() const { return m_results; }
    // The var "Result". Throws CNoSuchObjectError if there is none.
    P<CRemoteVar> getResult() const;

protected:
    explicit CRemoteFunction(const CStringArg& name);
    ~CRemoteFunction() override;

    void addResult(const P<CRemoteVar>& var) { m_results.push_back(var); }
    template <class Var> P<Var> addResult() {
        P<Var> var = make<Var>("Result");
        m_results.push_back(var);
        return var;
    }

private:
    std::vector<P<CRemoteVar>> m_results;
};

} // namespace peru
