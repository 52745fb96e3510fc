// The named, typed values that cross a connection as parameters and results of remote procedures.
#pragma once

#include "peru/ISerializable.h"
#include "peru/Object.h"
#include "peru/uri/URI.h"

#include <cstring>
#include <type_traits>

namespace peru {

// Written as its name and its value. Reading compares the name with the var's own: order and names of
// parameters are checked on every call. A difference throws CRemoteException with "Parameter not expected"
// and leaves the rest of the stream unread, so the two ends no longer agree on where a message starts.
class PERU_API CRemoteVar : public CObject, public ISerializable {
public:
    const P<IString>& getName() const { return m_name; }
    void writeTo(const P<IDataOutStream>& stream) const final;
    void readFrom(const P<IDataInStream>& stream) final;

protected:
    explicit CRemoteVar(const CStringArg& name);
    ~CRemoteVar() override;

    virtual void writeValue(IDataOutStream& stream) const = 0;
    virtual void readValue(IDataInStream& stream) = 0;

private:
    P<IString> m_name; // UTF-8
};

// A var whose value is of a plain or counted type.
template <class T> class TRemoteVar : public CRemoteVar {
public:
    explicit TRemoteVar(const CStringArg& name, const T& value = T()) : CRemoteVar(name), m_value(value) {}

    const T& getValue() const { return m_value; }
    void setValue(const T& value) { m_value = value; }

protected:
    T m_value;
};

class PERU_API CRemoteVarInteger : public TRemoteVar<int32_t> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarInteger() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

class PERU_API CRemoteVarInteger64 : public TRemoteVar<int64_t> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarInteger64() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

class PERU_API CRemoteVarString : public TRemoteVar<P<IString>> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarString() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

class PERU_API CRemoteVarDouble : public TRemoteVar<double> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarDouble() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

class PERU_API CRemoteVarBool : public TRemoteVar<bool> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarBool() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

class PERU_API CRemoteVarURI : public TRemoteVar<P<IURI>> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarURI() override;

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;
};

// An object reads itself, so the var needs one to read into. The value is that object after reading, or empty
// if the peer has written none.
class PERU_API CRemoteVarObject : public TRemoteVar<P<ISerializable>> {
public:
    using TRemoteVar::TRemoteVar;
    ~CRemoteVarObject() override;

    // The object that the next read fills. Without one an object of the peer throws CInvalidArgError.
    void setTarget(const P<ISerializable>& target) { m_target = target; }

protected:
    void writeValue(IDataOutStream& stream) const override;
    void readValue(IDataInStream& stream) override;

private:
    P<ISerializable> m_target;
};

namespace detail {

PERU_API void writeStruct(IDataOutStream& stream, const void* record, uint32_t size);
PERU_API void readStruct(IDataInStream& stream, void* record, uint32_t size);

} // namespace detail

// A record without pointers, written as its size and its bytes; both ends are built with the same layout. The
// size of another layout throws CRemoteException before any of the bytes are read.
template <class T> class CRemoteVarStruct : public TRemoteVar<T> {
    static_assert(std::is_trivially_copyable_v<T>);

public:
    using TRemoteVar<T>::TRemoteVar;

protected:
    void writeValue(IDataOutStream& stream) const override {
        detail::writeStruct(stream, &this->m_value, sizeof(T));
    }
    void readValue(IDataInStream& stream) override { detail::readStruct(stream, &this->m_value, sizeof(T)); }
};

} // namespace peru
