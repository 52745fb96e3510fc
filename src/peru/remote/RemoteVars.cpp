#include "peru/remote/RemoteVars.h"

#include "peru/remote/RemoteException.h"

namespace peru {

namespace {

// Whether the next string of the stream is the expected one. A size that differs settles it: the bytes of a
// wrong string, which may be announced but never arrive, are not waited for.
bool readExpected(IDataInStream& stream, const P<IString>& expected) {
    const int32_t size = expected->getDataSize();
    if (stream.readInt32() != size) return false;
    char shortText[64];
    std::string longText;
    char* text = shortText;
    if (size > static_cast<int32_t>(sizeof shortText)) {
        longText.resize(static_cast<size_t>(size));
        text = longText.data();
    }
    stream.read(text, size);
    return std::memcmp(text, expected->getData(), static_cast<size_t>(size)) == 0;
}

} // namespace

CRemoteVar::CRemoteVar(const CStringArg& name)
    : m_name(CString::fromUTF8(CString::toStdString(name))->toUTF8String()) {}

CRemoteVar::~CRemoteVar() = default;

void CRemoteVar::writeTo(const P<IDataOutStream>& stream) const {
    stream->writeString(m_name);
    writeValue(*stream);
}

void CRemoteVar::readFrom(const P<IDataInStream>& stream) {
    if (!readExpected(*stream, m_name)) throw CRemoteException(newString("Parameter not expected"));
    readValue(*stream);
}

CRemoteVarInteger::~CRemoteVarInteger() = default;
void CRemoteVarInteger::writeValue(IDataOutStream& stream) const {
    stream.writeInt32(m_value);
}
void CRemoteVarInteger::readValue(IDataInStream& stream) {
    m_value = stream.readInt32();
}

CRemoteVarInteger64::~CRemoteVarInteger64() = default;
void CRemoteVarInteger64::writeValue(IDataOutStream& stream) const {
    stream.writeInt64(m_value);
}
void CRemoteVarInteger64::readValue(IDataInStream& stream) {
    m_value = stream.readInt64();
}

CRemoteVarString::~CRemoteVarString() = default;
void CRemoteVarString::writeValue(IDataOutStream& stream) const {
    stream.writeString(m_value);
}
void CRemoteVarString::readValue(IDataInStream& stream) {
    m_value = stream.readString();
}

CRemoteVarDouble::~CRemoteVarDouble() = default;
void CRemoteVarDouble::writeValue(IDataOutStream& stream) const {
    stream.writeDouble(m_value);
}
void CRemoteVarDouble::readValue(IDataInStream& stream) {
    m_value = stream.readDouble();
}

CRemoteVarBool::~CRemoteVarBool() = default;
void CRemoteVarBool::writeValue(IDataOutStream& stream) const {
    stream.writeBool(m_value);
}
void CRemoteVarBool::readValue(IDataInStream& stream) {
    m_value = stream.readBool();
}

CRemoteVarURI::~CRemoteVarURI() = default;
void CRemoteVarURI::writeValue(IDataOutStream& stream) const {
    stream.writeURI(m_value);
}
void CRemoteVarURI::readValue(IDataInStream& stream) {
    m_value = stream.readURI();
}

CRemoteVarObject::~CRemoteVarObject() = default;
void CRemoteVarObject::writeValue(IDataOutStream& stream) const {
    stream.writeObject(m_value);
}
void CRemoteVarObject::readValue(IDataInStream& stream) {
    m_value = stream.readObject(m_target);
}

namespace detail {

void writeStruct(IDataOutStream& stream, const void* record, uint32_t size) {
    stream.writeUInt32(size);
    stream.write(record, size);
}

void readStruct(IDataInStream& stream, void* record, uint32_t size) {
    if (stream.readUInt32() != size)
        throw CRemoteException(newString("CRemoveVarStruct: size of struct is different"));
    stream.read(record, size);
}

} // namespace detail

} // namespace peru
