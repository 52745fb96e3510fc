// Random changes to nested chunks, compared with the same changes to a tree of plain bytes.
#include "MemoryStream.h"
#include "chf/ChunkFile.h"

#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <vector>

namespace {

using namespace chf;
using tests::chunk;
using tests::CMemoryStream;

struct SNode {
    std::string id;
    std::string bytes; // of a leaf
    bool isContainer = false;
    std::vector<std::unique_ptr<SNode>> children;
    SNode* parent = nullptr;

    std::string body() const {
        std::string all = bytes;
        for (const auto& child : children) all += chunk(child->id, child->body());
        return all;
    }
    bool contains(const SNode* node) const {
        for (; node; node = node->parent)
            if (node == this) return true;
        return false;
    }
};

// A leaf that is open, with the iterator that stands on it.
struct SOpened {
    SNode* node;
    TRef<CChunkStream> stream;
    TRef<CChunkIterator> parent;
};

class CModel {
public:
    explicit CModel(unsigned seed) : m_random(seed) {
        m_root.isContainer = true;
        fill(m_root, 0);
        m_storage = TRef<CMemoryStream>(new CMemoryStream(tests::chunkFile(m_root.body())));
        m_file = OpenChunkFile(m_storage.get());
    }

    void step() {
        switch (pick(m_opened.empty() ? 5 : 8)) { // the last three change an open stream
        case 0:
        case 1:
            return open();
        case 2:
            return close();
        case 3:
            return addChunk();
        case 4:
            return removeChunk();
        case 5:
            return insert();
        case 6:
            return remove();
        default:
            return write();
        }
    }

    void check() {
        for (const SOpened& each : m_opened) {
            const auto size = static_cast<int64_t>(each.node->body().size());
            ASSERT_EQ(each.stream->GetSize(), size);
            // The root's own iterator moves on with every walk.
            if (each.node->parent != &m_root) {
                ASSERT_EQ(each.parent->GetChunkSize(), size);
            }
            std::string bytes(each.node->bytes.size(), '\0');
            each.stream->Seek(0);
            each.stream->Read(bytes.data(), static_cast<uint32_t>(bytes.size()));
            ASSERT_EQ(bytes, each.node->bytes);
        }
    }

    void finish() {
        while (!m_opened.empty()) close();
        m_file = {};
        ASSERT_EQ(m_storage->bytes, tests::chunkFile(m_root.body()));
    }

private:
    size_t pick(size_t count) { return m_random() % count; }
    std::string randomBytes() {
        std::string bytes(pick(40), '\0');
        for (char& each : bytes) each = static_cast<char>(m_random());
        return bytes;
    }

    std::unique_ptr<SNode> makeNode(SNode& parent, int depth) {
        auto node = std::make_unique<SNode>();
        node->id = std::string("c") + std::to_string(100 + pick(900));
        node->parent = &parent;
        node->isContainer = depth < 3 && pick(2) == 0;
        if (node->isContainer)
            fill(*node, depth);
        else
            node->bytes = randomBytes();
        return node;
    }
    void fill(SNode& node, int depth) {
        for (size_t count = pick(4); count > 0; --count) node.children.push_back(makeNode(node, depth + 1));
    }

    SNode& pickContainer() {
        SNode* node = &m_root;
        while (pick(3) != 0 && !node->children.empty()) {
            SNode* child = node->children[pick(node->children.size())].get();
            if (child->isContainer) node = child;
        }
        return *node;
    }

    // An iterator on the container, standing on its child with that index.
    TRef<CChunkIterator> walk(SNode& container, size_t index) {
        TRef<CChunkIterator> chunks = m_file;
        if (container.parent) {
            const auto& siblings = container.parent->children;
            size_t own = 0;
            while (siblings[own].get() != &container) ++own;
            chunks = walk(*container.parent, own)->OpenIterator();
        }
        chunks->Rewind();
        for (size_t i = 0; i <= index && chunks->Next(); ++i) {
            uint32_t id = 0;
            std::memcpy(&id, container.children[i]->id.data(), sizeof id);
            EXPECT_EQ(chunks->GetId(), id);
            EXPECT_EQ(chunks->GetChunkSize(), static_cast<int64_t>(container.children[i]->body().size()));
        }
        return chunks;
    }

    bool isOpenWithin(const SNode& node) const {
        return std::ranges::any_of(m_opened, [&](const SOpened& each) { return node.contains(each.node); });
    }

    void open() {
        SNode& container = pickContainer();
        if (container.children.empty()) return;
        const size_t index = pick(container.children.size());
        if (container.children[index]->isContainer) return;
        TRef<CChunkIterator> parent = walk(container, index);
        m_opened.push_back({container.children[index].get(), parent->OpenStream(), parent});
    }
    void close() {
        if (!m_opened.empty())
            m_opened.erase(m_opened.begin() + static_cast<ptrdiff_t>(pick(m_opened.size())));
    }

    void write() {
        SOpened& target = m_opened[pick(m_opened.size())];
        std::string& bytes = target.node->bytes;
        const size_t position = pick(bytes.size() + 1);
        const std::string data = randomBytes();
        bytes.resize(std::max(bytes.size(), position + data.size()));
        bytes.replace(position, data.size(), data);
        target.stream->Seek(static_cast<int64_t>(position));
        target.stream->Write(data.data(), static_cast<uint32_t>(data.size()));
    }
    void insert() {
        SOpened& target = m_opened[pick(m_opened.size())];
        const size_t position = pick(target.node->bytes.size() + 1);
        const std::string data = randomBytes();
        target.node->bytes.insert(position, data);
        target.stream->Seek(static_cast<int64_t>(position));
        target.stream->InsertSpace(static_cast<int64_t>(data.size()));
        target.stream->Write(data.data(), static_cast<uint32_t>(data.size()));
    }
    void remove() {
        SOpened& target = m_opened[pick(m_opened.size())];
        std::string& bytes = target.node->bytes;
        const size_t position = pick(bytes.size() + 1);
        const size_t count = pick(bytes.size() - position + 1);
        bytes.erase(position, count);
        target.stream->Seek(static_cast<int64_t>(position));
        target.stream->RemoveSpace(static_cast<int64_t>(count));
    }

    // At the end of a container or in front of one of its chunks. The streams of the chunk before must be
    // closed, since the space would be theirs.
    void addChunk() {
        SNode& container = pickContainer();
        const size_t index = pick(container.children.size() + 1);
        if (index > 0 && isOpenWithin(*container.children[index - 1])) return;
        std::unique_ptr<SNode> node = makeNode(container, 2);
        const std::string bytes = chunk(node->id, node->body());
        TRef<CChunkIterator> chunks = walk(container, index);
        if (index < container.children.size()) {
            chunks->Seek(chunks->GetPosition() - CChunkStream::kHeaderSize);
            chunks->InsertSpace(static_cast<int64_t>(bytes.size()));
        } else {
            chunks->Seek(chunks->GetSize());
        }
        chunks->Write(bytes.data(), static_cast<uint32_t>(bytes.size()));
        container.children.insert(container.children.begin() + static_cast<ptrdiff_t>(index),
                                  std::move(node));
    }
    void removeChunk() {
        SNode& container = pickContainer();
        if (container.children.empty()) return;
        const size_t index = pick(container.children.size());
        const SNode& node = *container.children[index];
        TRef<CChunkIterator> chunks = walk(container, index);
        chunks->Seek(chunks->GetPosition() - CChunkStream::kHeaderSize);
        chunks->RemoveSpace(static_cast<int64_t>(node.body().size()) + CChunkStream::kHeaderSize);
        std::erase_if(m_opened, [&](const SOpened& each) { return node.contains(each.node); });
        container.children.erase(container.children.begin() + static_cast<ptrdiff_t>(index));
        EXPECT_EQ(chunks->GetId(), 0u);
        EXPECT_EQ(chunks->Next(), index < container.children.size()) << "continues at the same offset";
    }

    std::mt19937 m_random;
    SNode m_root;
    TRef<CMemoryStream> m_storage;
    TRef<CChunkFile> m_file;
    std::vector<SOpened> m_opened;
};

} // namespace

TEST(ChunkModel, ChangesNestedChunksLikePlainBytes) {
    for (unsigned seed = 0; seed < 10000; ++seed) {
        SCOPED_TRACE(seed);
        CModel model(seed);
        for (int i = 0; i < 24; ++i) {
            model.step();
            model.check();
            if (HasFailure()) return;
        }
        model.finish();
        if (HasFailure()) return;
    }
}
