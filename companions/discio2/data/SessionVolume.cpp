#include "data/SessionVolume.h"

#include "writing/IsoLibrary.h"

#include <cstdlib>
#include <mutex>
#include <new>
#include <string_view>

namespace discio {

namespace {

constexpr int32_t kDescriptor = 16; // block of a volume
constexpr int32_t kSearched = 512;  // blocks of a track, for its root folder

uint32_t getNumber(const char* bytes) {
    uint32_t value = 0;
    for (int i = 4; i-- > 0;) value = value << 8 | static_cast<unsigned char>(bytes[i]);
    return value;
}

// Blocks by the addresses that the file system has for them. Addresses count from the start of the disc, but
// images may lack what is between two sessions, or start to count at the track.
class CAddressedReader {
public:
    CAddressedReader(std::unique_ptr<IDataReader> reader, int32_t start)
        : m_reader(std::move(reader)), m_start(start), m_name(m_reader->getName()) {
        char block[kDataSectorBytes];
        m_reader->read(start + kDescriptor, 1, block);
        if (std::string_view(block, 6) != "\1CD001") fail();
        const uint32_t root = getNumber(block + 158);
        for (const int64_t shift : {int64_t{0}, int64_t{-start}})
            if (isFolder(root - shift, root)) {
                m_shift = shift;
                return;
            }
        for (int32_t i = kDescriptor + 1; i < kSearched; ++i)
            if (isFolder(start + i, root)) {
                m_shift = int64_t{root} - (start + i);
                return;
            }
        fail();
    }

    uint32_t getStart() const { return static_cast<uint32_t>(m_start + m_shift); }
    void read(int64_t address, int64_t count, void* to) {
        const int64_t block = address - m_shift;
        if (block < 0 || block + count > INT32_MAX)
            throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM,
                             m_name + " has no block " + std::to_string(address));
        m_reader->read(static_cast<int32_t>(block), static_cast<int32_t>(count), to);
    }

private:
    [[noreturn]] void fail() const {
        throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM,
                         m_name + ": the data track has no file system that can be read");
    }
    // Whether a folder starts at a block, of which its own first entry says that it has that address.
    bool isFolder(int64_t block, uint32_t address) {
        char bytes[kDataSectorBytes];
        try {
            if (block < 0 || block > INT32_MAX) return false;
            m_reader->read(static_cast<int32_t>(block), 1, bytes);
        } catch (const CDiscError&) {
            return false;
        }
        constexpr unsigned char kShortestEntry = 34;
        return static_cast<unsigned char>(bytes[0]) >= kShortestEntry && getNumber(bytes + 2) == address &&
               bytes[32] == 1 && bytes[33] == 0;
    }

    std::unique_ptr<IDataReader> m_reader;
    int32_t m_start;
    std::string m_name;
    int64_t m_shift = 0; // of addresses against blocks
};

struct SNode {
    SDataEntry entry;
    std::vector<SNode> children = {};
};

// Reads the tree with libisofs, which knows about sessions.
class CTreeReader {
public:
    CTreeReader(CAddressedReader& reader, const std::string& name)
        : m_library(SIsoLibrary::get()), m_name(name), m_image(nullptr, m_library.iso_image_unref) {
        IsoImage* image = nullptr;
        m_library.check(m_library.iso_image_new("", &image), m_name);
        m_image.reset(image);
        IsoReadOpts* made = nullptr;
        m_library.check(m_library.iso_read_opts_new(&made, 0), m_name);
        const std::unique_ptr<IsoReadOpts, void (*)(IsoReadOpts*)> options(made,
                                                                           m_library.iso_read_opts_free);
        m_library.iso_read_opts_set_start_block(made, reader.getStart());
        m_library.iso_read_opts_set_no_aaip(made, 1);
        m_library.iso_read_opts_set_no_md5(made, 1);
        constexpr int kLowerCase = 3;
        m_library.iso_read_opts_set_ecma119_map(made, kLowerCase);
        const std::unique_ptr<IsoDataSource, void (*)(IsoDataSource*)> source(
            makeSource(reader), m_library.iso_data_source_unref);
        if (m_library.iso_image_import(image, source.get(), made, nullptr) < 0)
            throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM,
                             m_name + ": the file system of the data track cannot be read");
    }

    std::string getTitle() const {
        const char* title = m_library.iso_image_get_volume_id(m_image.get());
        std::string text = title ? title : "";
        text.erase(text.find_last_not_of(' ') + 1);
        return text;
    }
    std::vector<SNode> readTree() const { return readFolder(m_library.iso_image_get_root(m_image.get())); }

private:
    // The library releases it with free().
    static IsoDataSource* makeSource(CAddressedReader& reader) {
        auto* const source = static_cast<IsoDataSource*>(std::calloc(1, sizeof(IsoDataSource)));
        if (!source) throw std::bad_alloc();
        source->refcount = 1;
        source->open = [](IsoDataSource*) { return 1; };
        source->close = [](IsoDataSource*) { return 1; };
        source->read_block = [](IsoDataSource* from, uint32_t address, uint8_t* to) -> int {
            try {
                static_cast<CAddressedReader*>(from->data)->read(address, 1, to);
                return 1;
            } catch (...) {
                return ISO_FILE_READ_ERROR;
            }
        };
        source->free_data = [](IsoDataSource*) {};
        source->data = &reader;
        return source;
    }

    std::vector<SNode> readFolder(IsoDir* folder) const {
        IsoDirIter* made = nullptr;
        m_library.check(m_library.iso_dir_get_children(folder, &made), m_name);
        const std::unique_ptr<IsoDirIter, void (*)(IsoDirIter*)> children(made, m_library.iso_dir_iter_free);
        std::vector<SNode> nodes;
        for (IsoNode* each = nullptr; m_library.iso_dir_iter_next(made, &each) == 1;) {
            const IsoNodeType type = m_library.iso_node_get_type(each);
            if (type != LIBISO_DIR && type != LIBISO_FILE) continue;
            SNode node;
            const char* name = m_library.iso_node_get_name(each);
            node.entry.name = node.entry.stored = name ? name : "";
            node.entry.modified = m_library.iso_node_get_mtime(each);
            node.entry.isFolder = type == LIBISO_DIR;
            if (node.entry.isFolder)
                node.children = readFolder(reinterpret_cast<IsoDir*>(each));
            else
                setExtents(reinterpret_cast<IsoFile*>(each), node.entry);
            nodes.push_back(std::move(node));
        }
        return nodes;
    }
    void setExtents(IsoFile* file, SDataEntry& entry) const {
        entry.size = m_library.iso_file_get_size(file);
        int count = 0;
        iso_file_section* made = nullptr;
        if (m_library.iso_file_get_old_image_sections(file, &count, &made, 0) != 1) return;
        const std::unique_ptr<iso_file_section, void (*)(void*)> sections(made, std::free);
        for (int i = 0; i < count; ++i) entry.extents.push_back({made[i].block, made[i].size});
    }

    const SIsoLibrary& m_library;
    std::string m_name;
    std::unique_ptr<IsoImage, void (*)(IsoImage*)> m_image;
};

class CSessionVolume : public IDataVolume {
public:
    CSessionVolume(std::unique_ptr<IDataReader> reader, int32_t start)
        : m_name(reader->getName()), m_reader(std::move(reader), start) {
        const CTreeReader tree(m_reader, m_name);
        m_title = tree.getTitle();
        m_root = tree.readTree();
    }

    std::string getTitle() override { return m_title; }

    std::vector<SDataEntry> list(const DataPath& folder) override {
        const std::vector<SNode>* nodes = &m_root;
        for (const std::string& part : folder) {
            const auto found = std::find_if(nodes->begin(), nodes->end(), [&](const SNode& node) {
                return node.entry.isFolder && node.entry.stored == part;
            });
            if (found == nodes->end())
                throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM, m_name + ": " + part + " cannot be read");
            nodes = &found->children;
        }
        std::vector<SDataEntry> entries;
        for (const SNode& node : *nodes) entries.push_back(node.entry);
        return entries;
    }

    void readBlocks(int64_t block, int64_t count, void* to) override {
        std::lock_guard lock(m_mutex);
        m_reader.read(block, count, to);
    }

private:
    std::string m_name;
    std::mutex m_mutex; // guards the reader
    CAddressedReader m_reader;
    std::string m_title;
    std::vector<SNode> m_root;
};

} // namespace

std::shared_ptr<IDataVolume> openSessionVolume(std::unique_ptr<IDataReader> reader, int32_t start) {
    return std::make_shared<CSessionVolume>(std::move(reader), start);
}

} // namespace discio
