// The tag of a file, through the exports.
#pragma once

#include "Library.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

struct STagField {
    const char* name; // on the command line
    const char* key;  // in JSON
    const char* title;
    decltype(CLibrary::FileTag_GetTitle) CLibrary::*get;
    decltype(CLibrary::FileTag_SetTitle) CLibrary::*set;
};

// In the order in which they are shown.
const std::vector<STagField>& getTagFields();

// What a sound of more than 4 GB becomes: it is called WAV too, but has no place for a tag.
bool isWideWav(const std::filesystem::path& file);

class CFileTag {
public:
    // Throws std::runtime_error for a file whose tag cannot be read. False afterwards for a kind of file that
    // has no tags.
    CFileTag(CLibrary& library, const std::filesystem::path& file);
    explicit operator bool() const { return static_cast<bool>(m_tag); }

    std::u16string get(const STagField& field) const;
    void set(const STagField& field, const std::u16string& text);
    // Once. Throws std::runtime_error with the file as it was.
    void store();

private:
    CLibrary& m_library;
    std::filesystem::path m_file;
    CHandle m_tag;
};

} // namespace host
