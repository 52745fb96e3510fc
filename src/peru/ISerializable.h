// Typed values on streams, and objects that serialise themselves.
#pragma once

#include "peru/streams/IStreams.h"
#include "peru/strings/String.h"

namespace peru {

class IDataInStream;
class IDataOutStream;
class IURI;

class PERU_API ISerializable : public virtual IBase {
public:
    virtual void writeTo(const P<IDataOutStream>& stream) const = 0;
    virtual void readFrom(const P<IDataInStream>& stream) = 0;
};

// Little-endian, untagged. A string is written as its UTF-8 byte count (int32) and its bytes, an object as a
// null flag, its own form and the check word 123456.
class PERU_API IDataOutStream : public virtual IOutStream {
public:
    virtual void writeInt8(int8_t value) = 0;
    virtual void writeUInt8(uint8_t value) = 0;
    virtual void writeInt16(int16_t value) = 0;
    virtual void writeUInt16(uint16_t value) = 0;
    virtual void writeInt32(int32_t value) = 0;
    virtual void writeUInt32(uint32_t value) = 0;
    virtual void writeInt64(int64_t value) = 0;
    virtual void writeUInt64(uint64_t value) = 0;
    virtual void writeFloat(float value) = 0;
    virtual void writeDouble(double value) = 0;
    virtual void writeBool(bool value) = 0;
    virtual void writeString(const P<IString>& value) = 0;
    virtual void writeObject(const P<ISerializable>& object) = 0;
    virtual void writeURI(const P<IURI>& uri) = 0;
};

class PERU_API IDataInStream : public virtual IInStream {
public:
    virtual int8_t readInt8() = 0;
    virtual uint8_t readUInt8() = 0;
    virtual int16_t readInt16() = 0;
    virtual uint16_t readUInt16() = 0;
    virtual int32_t readInt32() = 0;
    virtual uint32_t readUInt32() = 0;
    virtual int64_t readInt64() = 0;
    virtual uint64_t readUInt64() = 0;
    virtual float readFloat() = 0;
    virtual double readDouble() = 0;
    virtual bool readBool() = 0;
    virtual P<IString> readString() = 0; // empty if the stream ends within the byte count
    // Lets the given object read itself; returns an empty handle if a null was written. Throws CException
    // with "Error in object serialization.. write/read differ?" if the check word does not follow.
    virtual P<ISerializable> readObject(const P<ISerializable>& object) = 0;
    virtual P<IURI> readURI() = 0;
};

class PERU_API IResetableDataInStream : public virtual IDataInStream, public virtual IResetableInStream {};
class PERU_API IResetableDataOutStream : public virtual IDataOutStream, public virtual IResetableOutStream {};
class PERU_API ISeekableDataInStream : public virtual IResetableDataInStream,
                                       public virtual ISeekableInStream {};
class PERU_API ISeekableDataOutStream : public virtual IResetableDataOutStream,
                                        public virtual ISeekableOutStream {};

} // namespace peru
