#include "peru/pipes/PipeSupport.h"

#include <random>

namespace {

using namespace peru;
using tests::errorOf;
using tests::titleOf;

class PipeStreams : public tests::CPipeTest {};

TEST_F(PipeStreams, CarryEveryByteInOrderBothWays) {
    const SPair pair = connect();
    std::mt19937 random(7);
    std::string bytes(3'000'000, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    const auto send = [&](const P<IPipeOutStream>& out, unsigned seed) {
        std::mt19937 sizes(seed);
        for (size_t done = 0; done < bytes.size();) {
            const size_t first = std::min<size_t>(sizes() % 70'000, bytes.size() - done);
            const size_t second = std::min<size_t>(sizes() % 100, bytes.size() - done - first);
            const SPipePart parts[] = {{bytes.data() + done, int64_t(first)},
                                       {nullptr, 0},
                                       {bytes.data() + done + first, int64_t(second)}};
            out->writeParts(parts, std::size(parts));
            done += first + second;
        }
    };
    const auto receive = [&](const P<IPipeInStream>& in, unsigned seed) {
        std::mt19937 sizes(seed);
        std::string result(bytes.size(), '\0');
        for (size_t done = 0; done < result.size();) {
            const size_t size = std::min<size_t>(sizes() % 50'000, result.size() - done);
            if (sizes() % 2) {
                in->read(result.data() + done, int64_t(size));
                done += size;
            } else {
                done += size_t(in->readSome(result.data() + done, int64_t(size)));
            }
        }
        EXPECT_EQ(in->getAvailable(), 0);
        return result == bytes;
    };
    std::thread sender([&] { send(pair.client->getOutStream(), 1); });
    std::thread back([&] { send(pair.accepted->getOutStream(), 2); });
    bool there = false;
    std::thread receiver([&] { there = receive(pair.accepted->getInStream(), 3); });
    EXPECT_TRUE(receive(pair.client->getInStream(), 4));
    for (std::thread* thread : {&sender, &back, &receiver}) thread->join();
    EXPECT_TRUE(there);
}

TEST_F(PipeStreams, NameEachWayToFail) {
    uint8_t byte;
    const P<IPipeClient> apart = client();
    const P<IPipeInStream> nowhere = apart->getInStream();
    EXPECT_EQ(titleOf([&] { nowhere->read(&byte, 1); }), "Invalid pipe handle");
    EXPECT_EQ(titleOf([&] { apart->getOutStream()->write("x", 1); }), "Invalid pipe handle");
    EXPECT_FALSE(apart->getOutStream()->writeByte(1));
    EXPECT_EQ(nowhere->getAvailable(), 0);
    EXPECT_FALSE(nowhere->waitForData(0));
    EXPECT_TRUE(nowhere->isAtEnd());
    const SPipePart bad[] = {{"x", -1}, {"x", 1}};
    EXPECT_THROW(apart->getOutStream()->writeParts(bad, 2), CInvalidArgError);
    EXPECT_THROW(apart->getOutStream()->write("x", -1), CInvalidArgError);
    EXPECT_THROW(server()->getOutStream()->write("x", -1), CInvalidArgError);
    EXPECT_THROW(nowhere->read(&byte, -1), CInvalidArgError);
    EXPECT_THROW(nowhere->readSome(&byte, -1), CInvalidArgError);
    EXPECT_THROW(nowhere->skip(-1), CInvalidArgError);
    EXPECT_TRUE(apart->getOutStream()->isAtEnd());

    SPair pair = connect();
    const P<IPipeInStream> in = pair.accepted->getInStream();
    EXPECT_TRUE(pair.client->getOutStream()->writeByte('a'));
    pair.client->getOutStream()->write("bc", 2);
    pair.accepted->getOutStream()->write("unread", 6); // turns the end into a reset
    pair.client = nullptr;
    EXPECT_EQ(in->getAvailable(), 3);
    EXPECT_TRUE(pair.accepted->isAlive());
    char bytes[4] = {};
    in->skip(1);
    in->read(bytes, 2);
    EXPECT_STREQ(bytes, "bc");
    EXPECT_FALSE(pair.accepted->isAlive());
    EXPECT_EQ(errorOf<CFinishedError>([&] { in->read(&byte, 1); }), "Pipe was closed");
    EXPECT_EQ(in->readSome(&byte, 1), 0);
    // SIGPIPE would end the test.
    EXPECT_EQ(titleOf([&] { pair.accepted->getOutStream()->write("x", 1); }), "Error write data to pipe");
    EXPECT_FALSE(pair.accepted->getOutStream()->writeByte(1));

    // Each of these closes both directions.
    for (int way = 0; way < 3; ++way) {
        pair = connect();
        const P<IPipeInStream> rest = pair.client->getInStream();
        const P<IPipeOutStream> out = pair.client->getOutStream();
        if (way == 0) rest->close();
        if (way == 1) out->close();
        if (way == 2) pair.client = nullptr;
        EXPECT_EQ(titleOf([&] { rest->read(&byte, 1); }), "Invalid pipe handle") << way;
        EXPECT_EQ(titleOf([&] { out->write("x", 1); }), "Invalid pipe handle") << way;
        EXPECT_TRUE(pair.accepted->getInStream()->isAtEnd());
    }
}

TEST_F(PipeStreams, WaitsEndByDeadlineAbortAndClose) {
    const SPair pair = connect();
    const P<IPipeInStream> in = pair.accepted->getInStream();
    const P<IPipeOutStream> out = pair.accepted->getOutStream();
    const std::string flood(1'000'000, 'x');
    const auto read = [&] {
        char bytes[2];
        in->read(bytes, 2);
    };
    const auto write = [&] { out->write(flood.data(), int64_t(flood.size())); };
    pair.client->getOutStream()->writeByte(1); // half of what is read
    in->setDeadline(20);
    EXPECT_EQ(titleOf(read), "The deadline for reading from the pipe has passed");
    int asked = 0;
    const auto start = std::chrono::steady_clock::now();
    for (const P<IPipeStream>& stream : {P<IPipeStream>(in), P<IPipeStream>(out)}) {
        stream->setExtension([&] { return ++asked % 3 != 0; });
        stream->setDeadline(20);
    }
    EXPECT_EQ(titleOf(read), "The deadline for reading from the pipe has passed");
    EXPECT_EQ(asked, 3);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(59)) << "three times 20 ms";
    EXPECT_EQ(titleOf(write), "The deadline for writing to the pipe has passed");
    EXPECT_EQ(asked, 6);
    for (const P<IPipeStream>& stream : {P<IPipeStream>(in), P<IPipeStream>(out)}) {
        stream->setExtension(nullptr);
        stream->setDeadline(IPipeStream::kNoDeadline);
    }

    const auto after = [](auto&& action) {
        return std::thread([action] {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
            action();
        });
    };
    std::thread aborter = after([in] { in->abort(); });
    EXPECT_EQ(errorOf<CAbortedError>(read), "Read was aborted");
    EXPECT_EQ(errorOf<CAbortedError>(read), "Read was aborted") << "until it is resumed";
    aborter.join();
    in->resume();
    aborter = after([out] { out->abort(); });
    EXPECT_EQ(titleOf(write), "Error write data to pipe");
    aborter.join();
    pair.client->getOutStream()->write("ok", 2);
    EXPECT_NO_THROW(read());
    aborter = after([end = pair.accepted] { end->close(); });
    EXPECT_EQ(titleOf(read), "Invalid pipe handle");
    aborter.join();
}

TEST_F(PipeStreams, BusyServerIsAwaitedForASecond) {
    std::filesystem::create_directory(path("").parent_path());
    ::chmod(path("").parent_path().c_str(), 0700);
    const tests::CRawSocket busy(path(), true);
    EXPECT_TRUE(client()->connect()) << "the queue has room for one";
    EXPECT_FALSE(client()->connect());
}

} // namespace
