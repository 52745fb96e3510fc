#include "peru/Errors.h"
#include "peru/Rival.h"
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

#include <functional>
#include <random>
#include <sys/stat.h>
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
        switch (random() % 8) {
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
        case 7:
            if (position + size <= model.size()) {
                stream->skip(static_cast<int64_t>(size));
                position += size;
            } else {
                EXPECT_THROW(stream->skip(static_cast<int64_t>(size)), CEndOfStreamError);
            }
        }
        ASSERT_EQ(stream->getPosition(), static_cast<int64_t>(position)) << i;
        ASSERT_EQ(stream->getSize(), static_cast<int64_t>(model.size())) << i;
        ASSERT_EQ(stream->isAtEnd(), position >= model.size()) << i;
    }
    stream->reset();
    ASSERT_EQ(readAll(*stream), model);
}

void compareReading(const P<ISeekableInStream>& stream, const std::string& model) {
    std::mt19937 random(1);
    size_t position = 0;
    for (int i = 0; i < 1000; ++i) {
        std::string bytes(random() % 20, '\0');
        if (i % 3 == 0) {
            position = random() % (model.size() + 10);
            stream->seek(static_cast<int64_t>(position));
        } else if (i % 3 == 1 && position + bytes.size() <= model.size()) {
            stream->skip(std::ssize(bytes));
            position += bytes.size();
        } else {
            bytes.resize(static_cast<size_t>(stream->readSome(bytes.data(), std::ssize(bytes))));
            ASSERT_EQ(bytes, position < model.size() ? model.substr(position, bytes.size()) : "");
            position += bytes.size();
        }
        ASSERT_EQ(stream->getPosition(), static_cast<int64_t>(position)) << i;
        ASSERT_EQ(stream->getSize(), std::ssize(model)) << i;
        ASSERT_EQ(stream->isAtEnd(), position >= model.size()) << i;
    }
}

TEST(Streams, AgreeWithAByteArray) {
    const tests::CTempFolder folder;
    for (unsigned seed = 0; seed < 4; ++seed) {
        std::optional<tests::CSystemCalls> interruptions;
        if (seed % 2) interruptions.emplace(tests::interrupt);
        compareWithModel(make<CDiskIOStream>(toURI(folder / "file"), EOpenMode::create), 200000, seed);
        interruptions.reset();
        compareWithModel(make<CMemoryIOStream>(), 5000, seed);
    }
    const std::string letters = "ABCDEFGHIJKLMNOPQRSTUVWXYZ";
    compareReading(make<CStringInStream>(newString(letters.c_str())), letters);
    const P<CStringOutStream> out = make<CStringOutStream>();
    const std::string many(200000, 'x');
    EXPECT_EQ(copyStream(*make<CStringInStream>(newString(many.c_str())), *out), 200000);
    EXPECT_TRUE(out->isAtEnd() && out->getPosition() == 200000 && text(out->getString()) == many);
    out->reset();
    EXPECT_TRUE(out->getString()->isEmpty());
    const P<CDiskIOStream> sparse = make<CDiskIOStream>(toURI(folder / "sparse"), EOpenMode::create);
    const int64_t far = (int64_t{5} << 32) + 3;
    sparse->seek(far);
    write(*sparse, "end");
    EXPECT_EQ(sparse->getSize(), far + 3);
    sparse->seek(far - 1);
    EXPECT_EQ(readAll(*sparse), std::string("\0end", 4));
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
}

TEST(Streams, ErrorsNameTheStream) {
    const tests::CTempFolder folder;
    const P<IURI> uri = toURI(folder.write("file", "abc"));
    const P<CDiskInStream> disk = make<CDiskInStream>(uri);
    char bytes[4];
    for (const P<IInStream>& stream : std::vector<P<IInStream>>{
             disk, make<CDiskIOStream>(uri, EOpenMode::open), make<CStringInStream>(newString("abc"))}) {
        EXPECT_THROW(stream->skip(4), CEndOfStreamError);
        EXPECT_THROW(stream->skip(-1), CInvalidArgError);
        EXPECT_EQ(readAll(*stream), "abc");
    }
    for (const P<IOutStream>& stream : std::vector<P<IOutStream>>{
             make<CDiskIOStream>(uri, EOpenMode::open), make<CMemoryIOStream>(), make<CStringOutStream>()})
        EXPECT_THROW(stream->write(bytes, -1), CInvalidArgError);
    disk->reset();
    EXPECT_EQ(errorOf<CEndOfStreamError>([&] { disk->read(bytes, 4); }),
              "Unexpected end of data stream (uri: '" + text(uri->getAsString()) + "').");
    EXPECT_EQ(errorOf<CEndOfStreamError>([&] { make<CStringInStream>(newString("abc"))->read(bytes, 4); }),
              "Unexpected end of data stream.");
    EXPECT_THROW(disk->readSome(bytes, -1), CInvalidArgError);
    EXPECT_THROW(disk->seek(-1), CInvalidArgError);
    disk->close();
    EXPECT_EQ(errorOf<CStreamClosedError>([&] { disk->seek(0); }),
              "The stream has been closed (uri: '" + text(uri->getAsString()) + "').");
}

TEST(DiskStream, OpenModes) {
    const tests::CTempFolder folder;
    const auto file = folder / "file";
    const auto put = [&](EOpenMode mode, const std::string& bytes) {
        write(*make<CDiskOutStream>(toURI(file), mode), bytes); // the destructor closes it
        return tests::readFile(file);
    };
    EXPECT_THROW(put(EOpenMode::open, "x"), CFileNotFoundError);
    EXPECT_EQ(put(EOpenMode::createNew, "12345"), "12345");
    EXPECT_THROW(put(EOpenMode::createNew, "x"), CStreamError);
    EXPECT_EQ(put(EOpenMode::open, "ab"), "ab345");
    EXPECT_EQ(put(EOpenMode::append, "6"), "ab3456");
    EXPECT_EQ(put(EOpenMode::create, "xyz"), "xyz");
    make<CDiskOutStream>(toURI(file), EOpenMode::open)->setSize(1);
    EXPECT_EQ(tests::readFile(file), "x");
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
    // Opening must not wait for the other end of a FIFO either.
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
    // As an ordinary user, even if the tests run as root.
    ::chmod((folder / "file").c_str(), 0);
    const bool root = ::geteuid() == 0;
    ASSERT_EQ(root ? ::seteuid(65534) : 0, 0);
    EXPECT_THROW(make<CDiskInStream>(toURI(folder / "file")), CFileAccessDeniedError);
    EXPECT_EQ(root ? ::seteuid(0) : 0, 0);
}

TEST(DiskStream, FullAndUnreadableFilesAreReported) {
    const auto open = [] { return make<CDiskOutStream>(make<CURI>("file:///dev/full"), EOpenMode::open); };
    EXPECT_THROW(write(*open(), std::string(200000, 'x')), CStreamError);
    write(*open(), "x"); // the destructor ignores the error
    const P<CDiskOutStream> stream = open();
    write(*stream, "x");
    EXPECT_THROW(stream->flush(), CStreamError);
    const std::string error = errorOf<CStreamError>([&] { stream->close(); }); // tries again
    EXPECT_NE(error.find("No space left on device"), std::string::npos) << error;
    EXPECT_NE(error.find("file:///dev/full"), std::string::npos) << error;
    stream->close(); // it is closed nevertheless
    const P<CDiskOutStream> device = make<CDiskOutStream>(make<CURI>("file:///dev/null"), EOpenMode::open);
    device->seek(0);
    device->flush(); // a device cannot be synchronised
    EXPECT_THROW(device->seek(1), CStreamError);
    EXPECT_THROW(device->setSize(1), CStreamError);
    char byte;
    const P<CDiskInStream> unreadable = make<CDiskInStream>(make<CURI>("file:///proc/self/mem"));
    EXPECT_EQ(errorOf<CStreamError>([&] { unreadable->readSome(&byte, 1); }),
              "The file 'file:///proc/self/mem' could not be read: Input/output error.");
}

TEST(DiskStream, FlushReachesTheDiskAndReportsItsErrors) {
    const tests::CTempFolder folder;
    const P<CDiskOutStream> stream = make<CDiskOutStream>(toURI(folder / "file"), EOpenMode::create);
    write(*stream, "abc");
    int synced = 0;
    const tests::CSystemCalls watch([&](const std::string& call, int) {
        if (call != "fdatasync") return 0;
        EXPECT_EQ(tests::readFile(folder / "file"), "abc");
        return ++synced == 1 ? 0 : EIO;
    });
    stream->flush();
    EXPECT_EQ(synced, 1);
    EXPECT_THROW(stream->flush(), CStreamError);
}

// Opens "res:" URIs by a function.
class CTestFactory : public CStreamFactory {
public:
    using Function = std::function<P<IInStream>(const P<IStreamFactory>& self)>;
    explicit CTestFactory(Function open) : m_open(std::move(open)) {}
    P<IInStream> tryGetInStream(const P<IURI>& uri) override {
        return uri->getScheme()->equals("res") ? m_open(P<IStreamFactory>::share(this)) : nullptr;
    }

private:
    Function m_open;
};

// Returns its own name as content.
P<IStreamFactory> makeFactory(const char* name) {
    return make<CTestFactory>([name](const auto&) { return make<CStringInStream>(newString(name)); });
}

TEST(StreamManager, AsksInTheOrderOfRegistration) {
    const P<CStreamManager> manager = make<CStreamManager>();
    const P<IStreamFactory> first = makeFactory("first");
    const P<IURI> uri = make<CURI>("res:x");
    manager->addFactory(first);
    for (int i = 0; i < 20; ++i) manager->addFactory(makeFactory("later"));
    EXPECT_EQ(readAll(*manager->getInStream(uri)), "first");
    manager->removeFactory(first);
    EXPECT_EQ(readAll(*manager->getInStream(uri)), "later");
    EXPECT_FALSE(manager->tryGetSeekableInStream(uri)); // supported, but not as a seekable stream
}

TEST(StreamManager, LetsOnlyTheFactoryThatItAsksChangeTheList) {
    const P<CStreamManager> manager = make<CStreamManager>();
    tests::CRivals rivals;
    manager->addFactory(make<CTestFactory>([&](const P<IStreamFactory>& self) {
        rivals.expectBlocked({[&, self] { manager->removeFactory(self); }});
        manager->removeFactory(self);
        for (int i = 0; i < 20; ++i) manager->addFactory(makeFactory("brought"));
        return nullptr;
    }));
    EXPECT_EQ(readAll(*manager->getInStream(make<CURI>("res:x"))), "brought");
}

TEST(StreamManager, OpensFilesAsEveryKind) {
    const tests::CTempFolder folder;
    const P<IURI> uri = toURI(folder.write("file", "abc"));
    const P<IStreamManager> manager = getStreamManager();
    const std::function<P<IStreamBase>(const P<IURI>&)> kinds[] = {
        [&](auto& u) { return manager->getResetableInStream(u); },
        [&](auto& u) { return manager->getResetableOutStream(u, EOpenMode::open); },
        [&](auto& u) { return manager->getResetableIOStream(u, EOpenMode::open); },
        [&](auto& u) { return manager->getSeekableOutStream(u, EOpenMode::open); }};
    for (const auto& open : kinds) {
        EXPECT_TRUE(open(uri)->getURI()->equals(uri));
        EXPECT_THROW(open(make<CURI>("unknown:x")), CURITypeNotSupportedError);
    }
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
