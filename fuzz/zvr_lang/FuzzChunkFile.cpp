// Arbitrary bytes as a chunk file and as the changes that are made to it: no change may be made outside of
// the storage, and the walk must end.
#include "chf/BaseStream.h"
#include "chf/ChunkFile.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

using namespace chf;

namespace {

// Aborts when it is used outside of its bytes.
class CStorage : public CBaseStream {
public:
    explicit CStorage(std::string bytes) : m_bytes(std::move(bytes)) {}
    int64_t GetPosition() override { return m_position; }
    int64_t GetSize() override { return static_cast<int64_t>(m_bytes.size()); }
    void Seek(int64_t position) override {
        if (position < 0) std::abort();
        m_position = position;
    }
    void Write(const void* buffer, uint32_t count) override {
        if (m_position > GetSize() || count > 1 << 20) std::abort();
        m_bytes.resize(std::max(m_bytes.size(), static_cast<size_t>(m_position) + count));
        std::memcpy(m_bytes.data() + m_position, buffer, count);
        m_position += count;
    }
    uint32_t Read(void* buffer, uint32_t count) override {
        const int64_t left = std::max<int64_t>(GetSize() - m_position, 0);
        const auto read = static_cast<uint32_t>(std::min<int64_t>(left, count));
        if (read > 0) std::memcpy(buffer, m_bytes.data() + m_position, read);
        m_position += read;
        return read;
    }
    void Truncate(int64_t size) override {
        if (size < 0 || size > GetSize()) std::abort();
        m_bytes.resize(static_cast<size_t>(size));
    }

private:
    std::string m_bytes;
    int64_t m_position = 0;
};

class CFuzzedFile {
public:
    CFuzzedFile(const uint8_t* data, size_t size)
        : m_next(data), m_end(data + size / 2), m_storage(new CStorage({m_end, data + size})) {}

    void run() {
        const TRef<CChunkFile> file = OpenChunkFile(m_storage.get());
        walk(*file, 0);
    }

private:
    uint8_t take() { return m_next < m_end ? *m_next++ : 0; }

    void walk(CChunkIterator& chunks, int depth) {
        int count = 0;
        for (chunks.Rewind(); chunks.Next(); ++count) {
            if (count > 1000) std::abort(); // the storage has no room for as many headers
            change(*chunks.OpenStream());
            if (depth < 4) walk(*chunks.OpenIterator(), depth + 1);
        }
    }

    // Bodies that claim more than the storage holds are only read, as the language files do.
    void change(CChunkStream& body) {
        char bytes[64] = {};
        const int64_t size = body.GetSize();
        const bool isWhole = size <= m_storage->GetSize() - body.GetBase();
        const uint8_t position = take();
        body.Seek(isWhole && size > 0 ? position % size : 0);
        switch (take() % 8) {
        case 0:
            if (isWhole && m_changes-- > 0) body.Write(bytes, take() % sizeof bytes);
            break;
        case 1:
            if (isWhole && m_changes-- > 0) body.InsertSpace(take() % 16);
            break;
        case 2:
            if (isWhole) body.RemoveSpace(std::min<int64_t>(take(), size - body.GetPosition()));
            break;
        default:
            body.Read(bytes, sizeof bytes);
        }
    }

    const uint8_t* m_next; // the first half of the input selects the changes
    const uint8_t* m_end;
    TRef<CStorage> m_storage;
    int m_changes = 50;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    CFuzzedFile(data, size).run();
    return 0;
}
