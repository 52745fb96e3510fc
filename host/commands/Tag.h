// tonewright tag show, set and copy
#pragma once

#include "library/Library.h"
#include "media/WholeTag.h"

#include <filesystem>
#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <utility>
#include <vector>

namespace host {

struct SShowTagOptions {
    std::vector<std::filesystem::path> files;
    bool all = false; // every field and picture, not only the usual fields
    bool json = false;
};

struct STagFields {
    std::map<std::string, std::u16string> usual; // by name; an empty text removes the field
    std::vector<std::pair<std::string, std::string>>
        others; // by key, several values in order; empty removes it
};

struct SSetTagOptions {
    std::vector<std::filesystem::path> files;
    STagFields fields;
    bool json = false;
};

struct SCopyTagOptions {
    std::filesystem::path from;
    std::vector<std::filesystem::path> to;
    bool json = false;
};

// Each returns an exit code.
int showTags(CLibrary& library, const SShowTagOptions& options);
int setTags(CLibrary& library, const SSetTagOptions& options);
int copyTags(const SCopyTagOptions& options);

// Returns whether the file was written; a file that already has these values is not. Throws
// std::runtime_error and leaves the file unchanged if it cannot hold all of them.
bool changeTag(CLibrary& library, const std::filesystem::path& file, const STagFields& fields);
// "FILE: changed", or a JSON object.
void printChanged(const std::filesystem::path& file, bool changed, bool json);
std::string describe(const STagPicture& picture); // "front, image/jpeg, 500x500, 81.2 kB"
nlohmann::json toJson(const STagPicture& picture);

} // namespace host
