#include "peru/Errors.h"
#include "peru/files/SystemCalls.h"
#include "peru/streams/Base64Streams.h"
#include "peru/streams/BufferedIOStream.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/streams/StreamManager.h"
#include "peru/streams/StringStreams.h"
#include "peru/streams/posix/DiskStreams.h"
#include "peru/uri/URI.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <atomic>
#include <chrono>
#include <cstring>
#include <functional>
#include <random>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

namespace {

using namespace peru;
using namespace peru::posix;
using tests::errorOf;
using tests::text;
using tests::toURI;

void write(IOutStream& stream, const std::string& bytes) {
    stream.write(bytes.data(), static_cast<int64_t>(bytes.size()));
}

// Random reads, writes, seeks and truncations of a stream must match those of a plain byte array.
void compareWithModel(const P<ISeekableIOStream>& stream, int64_t largest, unsigned seed) {
    std::mt19937 random(seed);
    std::string model;
    size_t position = 0;
    std::string bytes;
    P<IStreamMarker> marker = stream->createMarker();
    size_t marked = 0;
    for (int i = 0; i < 3000; ++i) {
        const size_t size = random() % 8 == 0 ? random() % static_cast<size_t>(largest) : random() % 64;
        switch (random() % 7) {
        case 0:
        case 1: {
            bytes.assign(size, '\0');
            for (char& c : bytes) c = static_cast<char>(random());
            write(*stream, bytes);
            if (size > 0) {
                model.resize(std::max(model.size(), position + size));
                model.replace(position, size, bytes);
            }
            position += size;
            break;
        }
        case 2:
        case 3: {
            bytes.assign(size, '\0');
            const int64_t count = stream->readSome(bytes.data(), static_cast<int64_t>(size));
            const size_t expected = std::min(size, model.size() - std::min(position, model.size()));
            ASSERT_EQ(count, static_cast<int64_t>(expected)) << i;
            ASSERT_TRUE(expected == 0 || bytes.compare(0, expected, model, position, expected) == 0) << i;
            position += expected;
            break;
        }
        case 4:
            position = random() % (model.size() + 100);
            stream->seek(static_cast<int64_t>(position));
            break;
        case 5:
            if (random() % 2 == 0) {
                marker = stream->createMarker();
                marked = position;
            } else {
                marker->restore();
                position = marked;
            }
            break;
        case 6:
            if (random() % 16 == 0) {
                model.resize(random() % (model.size() + 100));
                stream->setSize(static_cast<int64_t>(model.size()));
            }
            break;
        }
        ASSERT_EQ(stream->getPosition(), static_cast<int64_t>(position)) << i;
        ASSERT_EQ(stream->getSize(), static_cast<int64_t>(model.size())) << i;
        ASSERT_EQ(stream->isAtEnd(), position >= model.size()) << i;
    }
    stream->reset();
    ASSERT_EQ(readAll(*stream), model);
}

TEST(Streams, AgreeWithAByteArray) {
    const tests::CTempFolder folder;
    for (unsigned seed = 0; seed < 4; ++seed) {
        compareWithModel(make<CDiskIOStream>(toURI(folder / "file"), EOpenMode::create), 200000, seed);
        compareWithModel(make<CMemoryIOStream>(), 5000, seed);
    }
}

template <class Interface, class Operation>
void expectRefusal(const P<IStreamBase>& stream, Operation operation) {
    if (const P<Interface> capable = tryCast<Interface>(stream)) {
        EXPECT_THROW(operation(*capable), CStreamClosedError) << typeid(*stream.get()).name();
    }
}

TEST(Streams, RefuseEverythingOnceClosed) {
    const tests::CTempFolder folder;
    const P<IURI> uri = toURI(folder.write("file", "abc"));
    char c = 0;
    for (const P<IStreamBase>& stream : std::vector<P<IStreamBase>>{
             make<CDiskIOStream>(uri, EOpenMode::open), make<CMemoryIOStream>(), make<CStringOutStream>(),
             make<CStringInStream>(newString("abc")), make<CBufferedIOStream>(nullptr),
             make<CBase64InStream>(make<CStringInStream>(newString("QUJD"))),
             make<CBase64OutStream>(make<CStringOutStream>())}) {
        stream->close();
        stream->close();
        expectRefusal<IStreamBase>(stream, [](auto& s) { s.isAtEnd(); });
        for (const int64_t size : {0, 1}) {
            expectRefusal<IInStream>(stream, [&](auto& s) { s.read(&c, size); });
            expectRefusal<IInStream>(stream, [&](auto& s) { s.readSome(&c, size); });
            expectRefusal<IInStream>(stream, [&](auto& s) { s.skip(size); });
            expectRefusal<IOutStream>(stream, [&](auto& s) { s.write(&c, size); });
        }
        expectRefusal<IOutStream>(stream, [](auto& s) { s.flush(); });
        expectRefusal<IResetableStream>(stream, [](auto& s) { s.reset(); });
        expectRefusal<IResetableStream>(stream, [](auto& s) { s.getPosition(); });
        expectRefusal<ISeekableStream>(stream, [](auto& s) { s.seek(0); });
        expectRefusal<ISeekableStream>(stream, [](auto& s) { s.getSize(); });
        expectRefusal<ISeekableStream>(stream, [](auto& s) { s.createMarker(); });
        expectRefusal<ISeekableOutStream>(stream, [](auto& s) { s.setSize(0); });
    }
    const P<CDiskInStream> named = make<CDiskInStream>(uri);
    named->close();
    EXPECT_NE(errorOf<CStreamClosedError>([&] { named->seek(0); }).find(text(uri->getAsString())),
              std::string::npos);
}

TEST(Streams, ShortReadNamesTheStream) {
    const tests::CTempFolder folder;
    const P<IURI> uri = toURI(folder.write("file", "abc"));
    const P<CDiskInStream> disk = make<CDiskInStream>(uri);
    char bytes[4];
    EXPECT_THROW(disk->skip(4), CEndOfStreamError);
    EXPECT_EQ(errorOf<CEndOfStreamError>([&] { disk->read(bytes, 4); }),
              "Unexpected end of data stream (uri: '" + text(uri->getAsString()) + "').");
    EXPECT_EQ(errorOf<CEndOfStreamError>([&] { make<CStringInStream>(newString("abc"))->read(bytes, 4); }),
              "Unexpected end of data stream.");
    EXPECT_THROW(disk->readSome(bytes, -1), CInvalidArgError);
    EXPECT_THROW(disk->seek(-1), CInvalidArgError);
}

TEST(DiskStream, OpenModes) {
    const tests::CTempFolder folder;
    const auto file = folder / "file";
    const auto put = [&](EOpenMode mode, const std::string& bytes) {
        const P<CDiskOutStream> stream = make<CDiskOutStream>(toURI(file), mode);
        write(*stream, bytes);
        stream->close();
        return tests::readFile(file);
    };
    EXPECT_THROW(put(EOpenMode::open, "x"), CFileNotFoundError);
    EXPECT_EQ(put(EOpenMode::createNew, "12345"), "12345");
    EXPECT_THROW(put(EOpenMode::createNew, "x"), CStreamError);
    EXPECT_EQ(put(EOpenMode::open, "ab"), "ab345");
    EXPECT_EQ(put(EOpenMode::append, "6"), "ab3456");
    EXPECT_EQ(put(EOpenMode::create, "x"), "x");
}

TEST(DiskStream, WhatCannotBeOpenedSaysWhy) {
    const tests::CTempFolder folder;
    folder.write("file", "");
    EXPECT_THROW(make<CDiskInStream>(toURI(folder / "none")), CFileNotFoundError);
    EXPECT_THROW(make<CDiskInStream>(toURI(folder / "file" / "below")), CFileNotFoundError);
    EXPECT_THROW(make<CDiskOutStream>(toURI(folder / "none" / "x"), EOpenMode::create), CFileNotFoundError);
    EXPECT_THROW(make<CDiskInStream>(make<CURI>("file:///dev/null%00x")), CFileNotFoundError);
    EXPECT_THROW(make<CDiskInStream>(make<CURI>("http://host/x")), CFileNotFoundError);
    for (const P<IURI>& uri : {toURI(folder.path()), toURI(folder.path())->appendPath("/")}) {
        const std::string error = errorOf<CStreamError>([&] { make<CDiskInStream>(uri); });
        EXPECT_NE(error.find("Is a directory"), std::string::npos) << error;
        EXPECT_NE(error.find(folder.path().filename().string()), std::string::npos) << error;
    }
    // As an ordinary user, even if the tests run as root.
    ::chmod((folder / "file").c_str(), 0);
    const bool root = ::geteuid() == 0;
    ASSERT_EQ(root ? ::seteuid(65534) : 0, 0);
    EXPECT_THROW(make<CDiskInStream>(toURI(folder / "file")), CFileAccessDeniedError);
    EXPECT_EQ(root ? ::seteuid(0) : 0, 0);
}

TEST(DiskStream, FullDiskIsReported) {
    const P<IURI> full = make<CURI>("file:///dev/full");
    const std::string large(200000, 'x');
    EXPECT_THROW(write(*make<CDiskOutStream>(full, EOpenMode::open), large), CStreamError);

    const P<CDiskOutStream> flushed = make<CDiskOutStream>(full, EOpenMode::open);
    write(*flushed, "x");
    EXPECT_THROW(flushed->flush(), CStreamError);

    const P<CDiskOutStream> closed = make<CDiskOutStream>(full, EOpenMode::open);
    write(*closed, "x");
    const std::string error = errorOf<CStreamError>([&] { closed->close(); });
    EXPECT_NE(error.find("No space left on device"), std::string::npos) << error;
    EXPECT_NE(error.find("file:///dev/full"), std::string::npos) << error;
    closed->close(); // it is closed nevertheless

    write(*make<CDiskOutStream>(full, EOpenMode::open), "x"); // the destructor ignores the error
}

TEST(DiskStream, PositionsGoBeyond32Bits) {
    const tests::CTempFolder folder;
    const P<CDiskIOStream> stream = make<CDiskIOStream>(toURI(folder / "sparse"), EOpenMode::create);
    const int64_t far = (int64_t{5} << 32) + 3;
    stream->seek(far);
    write(*stream, "end");
    EXPECT_EQ(stream->getSize(), far + 3);
    stream->seek(far - 1);
    EXPECT_EQ(readAll(*stream), std::string("\0end", 4));
}

// Opening must not wait for the other end of a FIFO either.
TEST(DiskStream, RefusesWhatIsNoRegularFile) {
    const tests::CTempFolder folder;
    const auto pipe = folder / "pipe", socket = folder / "socket";
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    ASSERT_EQ(::mknod(socket.c_str(), S_IFSOCK | 0600, 0), 0);
    for (const auto& path : {pipe, socket}) {
        const P<IURI> uri = toURI(path);
        const std::string expected = "The file '" + text(uri->getAsString()) + "' is not a regular file.";
        EXPECT_EQ(errorOf<CStreamError>([&] { make<CDiskInStream>(uri); }), expected);
        EXPECT_EQ(errorOf<CStreamError>([&] { make<CDiskOutStream>(uri, EOpenMode::open); }), expected);
        EXPECT_EQ(errorOf<CStreamError>([&] { make<CDiskIOStream>(uri, EOpenMode::create); }), expected);
    }
    EXPECT_THROW(make<CDiskInStream>(make<CURI>("file:///dev/zero")), CStreamError);
}

TEST(DiskStream, FlushReachesTheDiskAndReportsItsErrors) {
    const tests::CTempFolder folder;
    const P<CDiskOutStream> stream = make<CDiskOutStream>(toURI(folder / "file"), EOpenMode::create);
    write(*stream, "abc");
    int synced = 0;
    const tests::CSystemCalls watch([&](const std::string& call, int) {
        EXPECT_EQ(call, "fdatasync");
        EXPECT_EQ(tests::readFile(folder / "file"), "abc");
        return ++synced == 1 ? 0 : EIO;
    });
    stream->flush();
    EXPECT_EQ(synced, 1);
    EXPECT_THROW(stream->flush(), CStreamError);
}

// Supports one URI and returns its own name as content.
class CNamedFactory : public CStreamFactory {
public:
    CNamedFactory(const char* uri, const char* name) : m_uri(uri), m_name(name) {}
    P<IInStream> tryGetInStream(const P<IURI>& uri) override {
        if (!uri->getAsString()->equals(m_uri)) return nullptr;
        return make<CStringInStream>(newString(m_name));
    }

private:
    const char* m_uri;
    const char* m_name;
};

TEST(StreamManager, AsksInTheOrderOfRegistration) {
    const P<CStreamManager> manager = make<CStreamManager>();
    const P<IStreamFactory> first = make<CNamedFactory>("res:x", "first");
    const P<IURI> uri = make<CURI>("res:x");
    manager->addFactory(first);
    for (int i = 0; i < 20; ++i) manager->addFactory(make<CNamedFactory>("res:x", "later"));
    EXPECT_EQ(readAll(*manager->getInStream(uri)), "first");
    manager->removeFactory(first);
    EXPECT_EQ(readAll(*manager->getInStream(uri)), "later");
    EXPECT_FALSE(manager->tryGetSeekableInStream(uri)); // supported, but not as a seekable stream
}

// Opens nothing itself, but runs a function when it is asked.
class CCallingFactory : public CStreamFactory {
public:
    explicit CCallingFactory(std::function<void(P<IStreamFactory>)> function)
        : m_function(std::move(function)) {}
    P<IInStream> tryGetInStream(const P<IURI>&) override {
        m_function(P<IStreamFactory>::share(this));
        return nullptr;
    }

private:
    std::function<void(P<IStreamFactory>)> m_function;
};

TEST(StreamManager, LetsAFactoryChangeTheListWhileItIsAsked) {
    const P<CStreamManager> manager = make<CStreamManager>();
    manager->addFactory(make<CCallingFactory>([&](const P<IStreamFactory>& self) {
        manager->removeFactory(self);
        for (int i = 0; i < 20; ++i) manager->addFactory(make<CNamedFactory>("res:x", "brought"));
    }));
    EXPECT_EQ(readAll(*manager->getInStream(make<CURI>("res:x"))), "brought");
}

TEST(StreamManager, LocksOutOtherThreadsWhileItAsks) {
    const P<CStreamManager> manager = make<CStreamManager>();
    std::thread other;
    std::atomic<bool> changed{false};
    manager->addFactory(make<CCallingFactory>([&](const P<IStreamFactory>& self) {
        other = std::thread([&, self] {
            manager->removeFactory(self);
            changed = true;
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(30));
        EXPECT_FALSE(changed);
    }));
    EXPECT_FALSE(manager->tryGetInStream(make<CURI>("res:x")));
    other.join();
}

TEST(StreamManager, TellsMissingFilesFromUnknownKinds) {
    const tests::CTempFolder folder;
    const P<IStreamManager> manager = getStreamManager();
    EXPECT_FALSE(manager->tryGetInStream(make<CURI>("unknown:x")));
    EXPECT_FALSE(manager->tryGetInStream(toURI(folder / "none")));
    EXPECT_THROW(manager->getSeekableInStream(toURI(folder / "none")), CFileNotFoundError);
    EXPECT_THROW(manager->getInStream(make<CURI>("relative")), CURITypeNotSupportedError);
    EXPECT_NE(errorOf<CURITypeNotSupportedError>([&] {
                  manager->getIOStream(make<CURI>("unknown:x"), EOpenMode::create);
              }).find("unknown:x"),
              std::string::npos);
}

} // namespace
