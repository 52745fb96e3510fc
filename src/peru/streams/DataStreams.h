// Adapters that add typed values to any input or output stream.
#pragma once

#include "peru/ISerializable.h"
#include "peru/Object.h"
#include "peru/uri/IURI.h"

#include <bit>
#include <limits>

namespace peru {

namespace detail {

// Values are written in the host's byte order, which the format fixes as little-endian.
static_assert(std::endian::native == std::endian::little);

PERU_API void writeString(IDataOutStream& stream, const P<IString>& value);
PERU_API void writeObject(IDataOutStream& stream, const P<ISerializable>& object);
PERU_API void writeURI(IDataOutStream& stream, const P<IURI>& uri);
// Returns an empty handle, with only the size read, if that is above `most`.
PERU_API P<IString> readString(IInStream& stream, int32_t most = std::numeric_limits<int32_t>::max());
PERU_API P<ISerializable> readObject(IDataInStream& stream, const P<ISerializable>& object);
PERU_API P<IURI> readURI(IDataInStream& stream);

// Implements the typed operations of `Interface` and forwards the others to a stream of the kind `Stream`.
template <class Interface, class Stream> class TDataOutStream : public CObject, public Interface {
public:
    explicit TDataOutStream(const P<Stream>& stream) : m_stream(stream) {}

    void close() override { m_stream->close(); }
    P<IURI> getURI() const override { return m_stream->getURI(); }
    bool isAtEnd() override { return m_stream->isAtEnd(); }
    void write(const void* buffer, int64_t size) override { m_stream->write(buffer, size); }
    void flush() override { m_stream->flush(); }

    void writeInt8(int8_t value) override { put(value); }
    void writeUInt8(uint8_t value) override { put(value); }
    void writeInt16(int16_t value) override { put(value); }
    void writeUInt16(uint16_t value) override { put(value); }
    void writeInt32(int32_t value) override { put(value); }
    void writeUInt32(uint32_t value) override { put(value); }
    void writeInt64(int64_t value) override { put(value); }
    void writeUInt64(uint64_t value) override { put(value); }
    void writeFloat(float value) override { put(value); }
    void writeDouble(double value) override { put(value); }
    void writeBool(bool value) override { put(static_cast<uint8_t>(value ? 1 : 0)); }
    void writeString(const P<IString>& value) override { detail::writeString(*this, value); }
    void writeObject(const P<ISerializable>& object) override { detail::writeObject(*this, object); }
    void writeURI(const P<IURI>& uri) override { detail::writeURI(*this, uri); }

protected:
    P<Stream> m_stream;

private:
    template <class T> void put(T value) { m_stream->write(&value, sizeof value); }
};

template <class Interface, class Stream> class TDataInStream : public CObject, public Interface {
public:
    explicit TDataInStream(const P<Stream>& stream) : m_stream(stream) {}

    void close() override { m_stream->close(); }
    P<IURI> getURI() const override { return m_stream->getURI(); }
    bool isAtEnd() override { return m_stream->isAtEnd(); }
    void read(void* buffer, int64_t size) override { m_stream->read(buffer, size); }
    int64_t readSome(void* buffer, int64_t size) override { return m_stream->readSome(buffer, size); }
    void skip(int64_t size) override { m_stream->skip(size); }

    int8_t readInt8() override { return get<int8_t>(); }
    uint8_t readUInt8() override { return get<uint8_t>(); }
    int16_t readInt16() override { return get<int16_t>(); }
    uint16_t readUInt16() override { return get<uint16_t>(); }
    int32_t readInt32() override { return get<int32_t>(); }
    uint32_t readUInt32() override { return get<uint32_t>(); }
    int64_t readInt64() override { return get<int64_t>(); }
    uint64_t readUInt64() override { return get<uint64_t>(); }
    float readFloat() override { return get<float>(); }
    double readDouble() override { return get<double>(); }
    bool readBool() override { return get<uint8_t>() != 0; }
    P<IString> readString() override { return detail::readString(*m_stream); }
    P<ISerializable> readObject(const P<ISerializable>& object) override {
        return detail::readObject(*this, object);
    }
    P<IURI> readURI() override { return detail::readURI(*this); }

protected:
    P<Stream> m_stream;

private:
    template <class T> T get() {
        T value;
        m_stream->read(&value, sizeof value);
        return value;
    }
};

// TResetable adds reset and position, TSeekable adds seeking.
template <class Base> class TResetable : public Base {
public:
    using Base::Base;
    void reset() override { this->m_stream->reset(); }
    int64_t getPosition() const override { return this->m_stream->getPosition(); }
};

template <class Base> class TSeekable : public TResetable<Base> {
public:
    using TResetable<Base>::TResetable;
    void seek(int64_t position) override { this->m_stream->seek(position); }
    int64_t getSize() const override { return this->m_stream->getSize(); }
    P<IStreamMarker> createMarker() override { return this->m_stream->createMarker(); }
};

} // namespace detail

class PERU_API CDataOutStream : public detail::TDataOutStream<IDataOutStream, IOutStream> {
public:
    using TDataOutStream::TDataOutStream;
};

class PERU_API CResetableDataOutStream
    : public detail::TResetable<detail::TDataOutStream<IResetableDataOutStream, IResetableOutStream>> {
public:
    using TResetable::TResetable;
};

class PERU_API CSeekableDataOutStream
    : public detail::TSeekable<detail::TDataOutStream<ISeekableDataOutStream, ISeekableOutStream>> {
public:
    using TSeekable::TSeekable;
    void setSize(int64_t size) override { m_stream->setSize(size); }
};

class PERU_API CDataInStream : public detail::TDataInStream<IDataInStream, IInStream> {
public:
    using TDataInStream::TDataInStream;
};

class PERU_API CResetableDataInStream
    : public detail::TResetable<detail::TDataInStream<IResetableDataInStream, IResetableInStream>> {
public:
    using TResetable::TResetable;
};

class PERU_API CSeekableDataInStream
    : public detail::TSeekable<detail::TDataInStream<ISeekableDataInStream, ISeekableInStream>> {
public:
    using TSeekable::TSeekable;
};

} // namespace peru
