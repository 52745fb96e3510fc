#include "data/DataVolume.h"
#include "data/DataFile.h"

#include <algorithm>
#include <cdio/iso9660.h>
#include <cdio/logging.h>
#include <cdio/udf.h>
#include <ctime>
#include <mutex>

namespace discio {

namespace {

class CIsoVolume : public IDataVolume {
public:
    explicit CIsoVolume(const std::string& path)
        : m_path(path), m_iso(iso9660_open_ext(path.c_str(), ISO_EXTENSION_ALL), iso9660_close) {
        // Sectors with headers have to be found first.
        if (m_iso) return;
        m_hasHeaders = true;
        m_iso.reset(iso9660_open_fuzzy_ext(path.c_str(), ISO_EXTENSION_ALL, 16));
    }
    explicit operator bool() const { return m_iso != nullptr; }

    std::string getTitle() override {
        std::lock_guard lock(m_mutex);
        char* title = nullptr;
        if (!iso9660_ifs_get_volume_id(m_iso.get(), &title) || !title) return {};
        std::string text = title;
        std::free(title);
        text.erase(text.find_last_not_of(' ') + 1);
        return text;
    }

    std::vector<SDataEntry> list(const DataPath& folder) override {
        std::lock_guard lock(m_mutex);
        std::string path = "/";
        for (const std::string& part : folder) path += part + "/";
        CdioList_t* found = iso9660_ifs_readdir(m_iso.get(), path.c_str());
        if (!found)
            throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM, m_path + ": " + path + " cannot be read");
        const uint8_t joliet = iso9660_ifs_get_joliet_level(m_iso.get());
        std::vector<SDataEntry> entries;
        for (CdioListNode_t* node = _cdio_list_begin(found); node; node = _cdio_list_node_next(node)) {
            auto* file = static_cast<iso9660_stat_t*>(_cdio_list_node_data(node));
            SDataEntry entry;
            entry.stored = entry.name = file->filename;
            entry.isFolder = file->type == iso9660_stat_s::_STAT_DIR;
            entry.size = entry.isFolder ? 0 : file->size;
            std::tm time = file->tm;
            if (time.tm_year > 0) entry.modified = ::timegm(&time) - file->tm.tm_gmtoff;
            if (file->rr.b3_rock != yep) { // drops the version and, of plain names, the capitals
                std::string shown(entry.stored.size() + 1, '\0');
                iso9660_name_translate_ext(entry.stored.c_str(), shown.data(), joliet);
                entry.name = shown.c_str();
            }
            if (!entry.isFolder) entry.extents.push_back({file->lsn, entry.size});
            if (entry.name == "." || entry.name == "..") continue;
            // Every 4 GB of a large file have a record of their own.
            if (!entry.isFolder && !entries.empty() && entries.back().stored == entry.stored) {
                entries.back().size += entry.size;
                entries.back().extents.push_back(entry.extents[0]);
            } else {
                entries.push_back(entry);
            }
        }
        iso9660_filelist_free(found);
        return entries;
    }

    void readBlocks(int64_t block, int64_t count, void* to) override {
        std::lock_guard lock(m_mutex);
        // The library reads blocks in a row as if there were nothing between them.
        const int64_t step = m_hasHeaders ? 1 : count;
        for (int64_t i = 0; i < count; i += step)
            if (iso9660_iso_seek_read(m_iso.get(), static_cast<char*>(to) + i * ISO_BLOCKSIZE,
                                      static_cast<lsn_t>(block + i),
                                      static_cast<long>(step)) != step * ISO_BLOCKSIZE)
                throw CDiscError(DISCIO_ERROR_READ_INPUT,
                                 m_path + ": block " + std::to_string(block + i) + " cannot be read");
    }

private:
    std::string m_path;
    std::mutex m_mutex; // guards the library's object, which has one position in the file
    std::unique_ptr<iso9660_t, bool (*)(iso9660_t*)> m_iso;
    bool m_hasHeaders = false; // the sectors
};

class CUdfVolume : public IDataVolume {
public:
    explicit CUdfVolume(const std::string& path) : m_path(path), m_udf(udf_open(path.c_str()), udf_close) {
        if (m_udf && !Entry(udf_get_root(m_udf.get(), true, 0), udf_dirent_free)) m_udf.reset();
    }
    explicit operator bool() const { return m_udf != nullptr; }

    std::string getTitle() override {
        std::lock_guard lock(m_mutex);
        char title[64] = {};
        Entry root(udf_get_root(m_udf.get(), true, 0), udf_dirent_free);
        if (udf_get_volume_id(m_udf.get(), title, sizeof title - 1) <= 0) return {};
        return title;
    }

    std::vector<SDataEntry> list(const DataPath& folder) override {
        std::lock_guard lock(m_mutex);
        Entry current(udf_get_root(m_udf.get(), true, 0), udf_dirent_free);
        for (const std::string& part : folder) {
            Entry next(nullptr, udf_dirent_free);
            // The iteration frees its entry when it ends by itself.
            for (udf_dirent_t* each = current.release(); each && (each = udf_readdir(each));) {
                if (each->b_parent || part != each->psz_name) continue;
                next.reset(udf_opendir(each));
                udf_dirent_free(each);
                break;
            }
            if (!next)
                throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM, m_path + ": " + part + " cannot be read");
            current = std::move(next);
        }
        std::vector<SDataEntry> entries;
        for (udf_dirent_t* each = current.release(); each && (each = udf_readdir(each));) {
            if (each->b_parent) continue;
            SDataEntry entry;
            entry.name = entry.stored = each->psz_name;
            entry.isFolder = each->b_dir;
            entry.size = entry.isFolder ? 0 : static_cast<int64_t>(udf_get_file_length(each));
            entry.modified = udf_get_modification_time(each);
            if (!entry.isFolder)
                setUdfExtents(entry, {reinterpret_cast<const char*>(&each->fe), sizeof each->fe},
                              each->i_part_start);
            entries.push_back(entry);
        }
        return entries;
    }

    void readBlocks(int64_t block, int64_t count, void* to) override {
        std::lock_guard lock(m_mutex);
        if (block + count > INT32_MAX || udf_read_sectors(m_udf.get(), to, static_cast<lsn_t>(block),
                                                          static_cast<long>(count)) != DRIVER_OP_SUCCESS)
            throw CDiscError(DISCIO_ERROR_READ_INPUT,
                             m_path + ": block " + std::to_string(block) + " cannot be read");
    }

private:
    using Entry = std::unique_ptr<udf_dirent_t, bool (*)(udf_dirent_t*)>;

    std::string m_path;
    std::mutex m_mutex; // guards the library's object, which has one position in the file
    std::unique_ptr<udf_t, bool (*)(udf_t*)> m_udf;
};

} // namespace

std::shared_ptr<IDataVolume> openDataVolume(const std::string& path) {
    // The library would print to the host's standard output.
    static const bool s_quiet = (cdio_log_set_handler([](cdio_log_level_t, const char*) {}), true);
    static_cast<void>(s_quiet);
    if (auto iso = std::make_shared<CIsoVolume>(path); *iso) return iso;
    if (auto udf = std::make_shared<CUdfVolume>(path); *udf) return udf;
    throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM, path + " has no file system that can be read");
}

std::optional<SDataEntry> IDataVolume::find(const DataPath& folder, const std::string& name) {
    for (SDataEntry& entry : list(folder))
        if (entry.name == name) return std::move(entry);
    return std::nullopt;
}

DataPath findFolder(IDataVolume& volume, const std::string& path) {
    DataPath found;
    for (size_t i = 0; i < path.size();) {
        const size_t end = std::min(path.find_first_of("\\/", i), path.size());
        const std::string part = path.substr(i, end - i);
        i = end + 1;
        if (part.empty()) continue;
        const std::optional<SDataEntry> entry = volume.find(found, part);
        if (!entry) throw CDiscError(DISCIO_ERROR_NOT_FOUND, part + " does not exist");
        if (!entry->isFolder) throw CDiscError(DISCIO_ERROR_NOT_A_FOLDER, part + " is not a folder");
        found.push_back(entry->stored);
    }
    return found;
}

} // namespace discio
