// tonewright tag
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace host {

struct SSetTagOptions {
    std::vector<std::filesystem::path> files;
    std::map<std::string, std::u16string> fields; // by name; an empty text removes the field
    bool json = false;
};

// Both return an exit code.
int showTags(CLibrary& library, const std::vector<std::filesystem::path>& files, bool json);
int setTags(CLibrary& library, const SSetTagOptions& options);

} // namespace host
