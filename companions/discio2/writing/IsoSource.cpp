#include "writing/IsoSource.h"
#include "writing/IsoLibrary.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <new>
#include <system_error>
#include <unistd.h>

namespace discio {

namespace {

constexpr mode_t kFolderMode = 0555; // everyone may read what is on a disc
constexpr mode_t kFileMode = 0444;
constexpr int64_t kBufferBytes = 256 << 10;

// A file that fails the write if it cannot be read, or is not what was added. The library's own would be
// filled up with zeros.
class CSourceFile {
public:
    CSourceFile(const SDataEntry& entry, ino_t number, std::shared_ptr<CFirstFailure> failure)
        : m_path(entry.source), m_size(entry.size), m_modified(entry.modified), m_number(number),
          m_failure(std::move(failure)) {}
    ~CSourceFile() { close(); }
    CSourceFile(const CSourceFile&) = delete;
    CSourceFile& operator=(const CSourceFile&) = delete;

    int64_t getSize() const { return m_size; }
    ino_t getNumber() const { return m_number; }

    int open() {
        return attempt(ISO_FILE_ERROR, [&] {
            m_file = ::open(m_path.c_str(), O_RDONLY | O_CLOEXEC);
            struct stat status {};
            if (m_file < 0 || ::fstat(m_file, &status) != 0) fail();
            if (status.st_size != m_size || status.st_mtim.tv_sec != m_modified)
                throw CDiscError(DISCIO_ERROR_READ_INPUT, m_path + " has changed since it was added");
            ::posix_fadvise(m_file, 0, 0, POSIX_FADV_SEQUENTIAL);
            m_position = 0;
            return 1;
        });
    }
    void close() {
        if (m_file >= 0) ::close(m_file);
        m_file = -1;
        m_buffer = {};
        m_used = 0;
    }
    // The library asks for one block at a time.
    int read(void* data, size_t size) {
        return attempt(ISO_FILE_READ_ERROR, [&] {
            size_t done = 0;
            while (done < size) {
                if (m_used == m_buffer.size() && !fill()) break;
                const size_t count = std::min(size - done, m_buffer.size() - m_used);
                std::memcpy(static_cast<char*>(data) + done, m_buffer.data() + m_used, count);
                done += count;
                m_used += count;
            }
            return static_cast<int>(done);
        });
    }

private:
    // False at the end.
    bool fill() {
        const auto wanted = static_cast<size_t>(std::min<int64_t>(kBufferBytes, m_size - m_position));
        m_buffer.resize(wanted);
        m_used = wanted; // nothing, until it is read
        if (wanted == 0) return false;
        ssize_t count = 0;
        do {
            count = ::read(m_file, m_buffer.data(), wanted);
        } while (count < 0 && errno == EINTR);
        if (count < 0) fail();
        if (count == 0) throw CDiscError(DISCIO_ERROR_READ_INPUT, m_path + " has become shorter");
        m_buffer.resize(static_cast<size_t>(count));
        m_used = 0;
        m_position += count;
        return true;
    }
    [[noreturn]] void fail() const {
        throw CDiscError(DISCIO_ERROR_READ_INPUT, m_path + ": " + std::generic_category().message(errno));
    }
    // Called by C code.
    template <class Body> int attempt(int failure, Body body) noexcept {
        try {
            return body();
        } catch (const CDiscError& error) {
            m_failure->set(error);
        } catch (...) {
            m_failure->set(CDiscError(DISCIO_ERROR_OUT_OF_MEMORY, m_path));
        }
        return failure;
    }

    std::string m_path;
    int64_t m_size;
    int64_t m_modified;
    ino_t m_number;
    std::shared_ptr<CFirstFailure> m_failure;
    int m_file = -1;
    int64_t m_position = 0; // behind the buffer
    std::vector<char> m_buffer;
    size_t m_used = 0;
};

// The library's iso_stream, which its header hides from C++.
struct SStream {
    IsoStreamIface* functions;
    int references;
    CSourceFile* file;
};

CSourceFile& getFile(IsoStream* stream) {
    return *reinterpret_cast<SStream*>(stream)->file;
}

IsoStreamIface s_fileFunctions{
    4,
    {'u', 's', 'e', 'r'},
    [](IsoStream* stream) { return getFile(stream).open(); },
    [](IsoStream* stream) {
        getFile(stream).close();
        return 1;
    },
    [](IsoStream* stream) -> off_t { return getFile(stream).getSize(); },
    [](IsoStream* stream, void* data, size_t size) { return getFile(stream).read(data, size); },
    [](IsoStream*) { return 1; },
    [](IsoStream* stream, unsigned int* system, dev_t* device, ino_t* number) {
        *system = 0x44434944;
        *device = 1;
        *number = getFile(stream).getNumber();
    },
    [](IsoStream* stream) { delete reinterpret_cast<SStream*>(stream)->file; },
    [](IsoStream*) { return 1; },
    [](IsoStream*, int) -> IsoStream* { return nullptr; },
    nullptr,
    [](IsoStream*, IsoStream**, int) -> int { return ISO_STREAM_NO_CLONE; },
};

// Builds the library's tree from a project's.
class CIsoTree {
public:
    CIsoTree(const SIsoLibrary& library, IsoImage* image, std::shared_ptr<CFirstFailure> failure)
        : m_library(library), m_image(image), m_failure(std::move(failure)) {}

    void fill(IsoDir* folder, const CVirtualDataDisc::SNode& node) {
        // The library inserts into a sorted list, which is searched from its start.
        for (auto i = node.children.rbegin(); i != node.children.rend(); ++i) {
            const SDataEntry& entry = i->second->entry;
            if (entry.isFolder) {
                IsoDir* added = nullptr;
                m_library.check(m_library.iso_image_add_new_dir(m_image, folder, entry.name.c_str(), &added),
                                entry.name);
                describe(reinterpret_cast<IsoNode*>(added), entry, kFolderMode);
                fill(added, *i->second);
            } else {
                addFile(folder, entry);
            }
        }
    }

private:
    void addFile(IsoDir* folder, const SDataEntry& entry) {
        auto file = std::make_unique<CSourceFile>(entry, ++m_number, m_failure);
        auto* const stream = static_cast<SStream*>(std::calloc(1, sizeof(SStream)));
        if (!stream) throw std::bad_alloc();
        *stream = {&s_fileFunctions, 1, file.release()};
        IsoFile* added = nullptr;
        const int result = m_library.iso_image_add_new_file(m_image, folder, entry.name.c_str(),
                                                            reinterpret_cast<IsoStream*>(stream), &added);
        if (result < 0) m_library.iso_stream_unref(reinterpret_cast<IsoStream*>(stream));
        m_library.check(result, entry.name);
        describe(reinterpret_cast<IsoNode*>(added), entry, kFileMode);
    }

    void describe(IsoNode* node, const SDataEntry& entry, mode_t mode) const {
        m_library.iso_node_set_permissions(node, mode);
        m_library.iso_node_set_uid(node, 0);
        m_library.iso_node_set_gid(node, 0);
        m_library.iso_node_set_mtime(node, entry.modified);
        m_library.iso_node_set_atime(node, entry.accessed);
        m_library.iso_node_set_ctime(node, entry.modified);
    }

    const SIsoLibrary& m_library;
    IsoImage* m_image;
    std::shared_ptr<CFirstFailure> m_failure;
    ino_t m_number = 0;
};

void configure(const SIsoLibrary& library, IsoWriteOpts* options, uint32_t tailBlocks) {
    library.iso_write_opts_set_iso_level(options, 3); // files of 4 GB and more
    library.iso_write_opts_set_rockridge(options, 1);
    library.iso_write_opts_set_joliet(options, 1);
    library.iso_write_opts_set_joliet_longer_paths(options, 1);
    library.iso_write_opts_set_joliet_long_names(options, 1);
    library.iso_write_opts_set_allow_deep_paths(options, 1);
    library.iso_write_opts_set_allow_longer_paths(options, 1);
    library.iso_write_opts_set_omit_version_numbers(options, 3);
    library.iso_write_opts_set_relaxed_vol_atts(options, 1);
    library.iso_write_opts_set_dir_rec_mtime(options, 7); // the files' own times in every tree
    library.iso_write_opts_set_always_gmt(options, 1);
    library.iso_write_opts_set_output_charset(options, "UTF-8");
    library.iso_write_opts_set_tail_blocks(options, tailBlocks);
}

} // namespace

CIsoSource::CIsoSource(const CVirtualDataDisc& disc, uint32_t tailBlocks) {
    const SIsoLibrary& library = SIsoLibrary::get();
    const std::string title = const_cast<CVirtualDataDisc&>(disc).getTitle();
    IsoImage* created = nullptr;
    library.check(library.iso_image_new(title.c_str(), &created), "the image");
    const std::unique_ptr<IsoImage, void (*)(IsoImage*)> image(created, library.iso_image_unref);
    library.iso_image_set_volume_id(created, title.c_str());
    CIsoTree(library, created, m_failure).fill(library.iso_image_get_root(created), disc.getRoot());
    IsoWriteOpts* configured = nullptr;
    library.check(library.iso_write_opts_new(&configured, 0), "the image");
    const std::unique_ptr<IsoWriteOpts, void (*)(IsoWriteOpts*)> options(configured,
                                                                         library.iso_write_opts_free);
    configure(library, configured, tailBlocks);
    library.check(library.iso_image_create_burn_source(created, configured, &m_source), "the image");
    m_size = m_source->get_size(m_source);
}

CIsoSource::~CIsoSource() {
    if (m_position < m_size) m_source->cancel(m_source); // ends the thread
    m_source->free_data(m_source);
    std::free(m_source);
}

size_t CIsoSource::read(void* data, size_t size) {
    const auto wanted =
        static_cast<size_t>(std::min<int64_t>(static_cast<int64_t>(size), m_size - m_position));
    if (wanted == 0) return 0;
    const int count = m_source->read_xt ? m_source->read_xt(m_source, static_cast<unsigned char*>(data),
                                                            static_cast<int>(wanted))
                                        : -1;
    m_failure->check();
    if (count != static_cast<int>(wanted))
        throw CDiscError(DISCIO_ERROR_INTERNAL,
                         "the image ends after " + std::to_string(m_position) + " bytes");
    m_position += count;
    return wanted;
}

} // namespace discio
