// New files that replace others only when all of them are complete.
#pragma once

#include "Error.h"

#include <cstdint>
#include <string>
#include <vector>

namespace discio {

// Collects files in a hidden folder beside their target. Whatever is in the folder at the end is removed.
class CStagedFiles {
public:
    // `target` is the path of one of the files; a symbolic link is followed. Throws CDiscError if it cannot
    // be written.
    explicit CStagedFiles(const std::string& target);
    ~CStagedFiles();
    CStagedFiles(const CStagedFiles&) = delete;
    CStagedFiles& operator=(const CStagedFiles&) = delete;

    // The file name of the target.
    const std::string& getName() const { return m_name; }
    std::string getPath(const std::string& name) const { return m_folder + "/" + name; }
    // Moves these files to their place, replacing others there, whose permissions they take over. If one
    // cannot be moved the others go back, and CDiscError is thrown.
    void commit(const std::vector<std::string>& names);

private:
    // Where a replaced file is kept that could not be exchanged.
    std::string getOldPath(const std::string& name) const { return getPath(name) + ".old"; }
    void move(const std::string& name) const;
    void moveBack(const std::string& name) const noexcept;

    std::string m_parent;
    std::string m_name;
    std::string m_folder;
};

// Writes a file from its beginning to its end. Throws CDiscError, with DISCIO_ERROR_NOT_ENOUGH_SPACE if the
// disk is full.
class CNewFile {
public:
    explicit CNewFile(const std::string& path);
    ~CNewFile();
    CNewFile(const CNewFile&) = delete;
    CNewFile& operator=(const CNewFile&) = delete;

    void write(const void* data, size_t size);
    // Zeros that take no space on the disk.
    void skip(int64_t size) { m_size += size; }
    int64_t getSize() const { return m_size; }
    // Flushes the file to its disk, from where it is read next.
    void finish();

private:
    [[noreturn]] void fail() const;

    std::string m_path;
    int m_file;
    int64_t m_size = 0;
    int64_t m_started = 0; // the kernel is writing what is before
};

} // namespace discio
