// The tag of a file, accessed through the exported functions.
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

struct STagField {
    const char* name;     // on the command line
    const char* key;      // in JSON
    const char* titleKey; // of the translations
    const char* title;
    decltype(CLibrary::FileTag_GetTitle) CLibrary::*get;
    decltype(CLibrary::FileTag_SetTitle) CLibrary::*set;
};

// In display order.
const std::vector<STagField>& getTagFields();
std::string getTitle(const STagField& field); // in the user's language

// Whether this is an RF64 file, the form of WAV for more than 4 GB, which cannot hold a tag.
bool isWideWav(const std::filesystem::path& file);

class CFileTag {
public:
    // Throws std::runtime_error if the tag cannot be read. For file types without tags the object converts to
    // false.
    CFileTag(CLibrary& library, const std::filesystem::path& file);
    explicit operator bool() const { return static_cast<bool>(m_tag); }

    std::u16string get(const STagField& field) const;
    void set(const STagField& field, const std::u16string& text);
    // At most once. Throws std::runtime_error and leaves the file unchanged on failure.
    void store();

private:
    CLibrary& m_library;
    std::filesystem::path m_file;
    CHandle m_tag;
};

} // namespace host
