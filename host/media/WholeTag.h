// All fields and pictures of a file's tag, in every format with tags.
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <initializer_list>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <tonewright/host.h>
#include <utility>
#include <vector>

namespace host {

// Extensions in lower case, with their points.
bool hasExtension(const std::filesystem::path& file, std::initializer_list<std::string_view> extensions);
// By the extension.
bool hasVorbisComment(const std::filesystem::path& file);
// Whether files with that extension can have a tag.
bool canHaveTag(const std::filesystem::path& file);
// Throws std::runtime_error unless this is an input file that can have a tag.
void checkTagged(const std::filesystem::path& file);

struct STagPicture {
    std::string data;
    std::string mimeType;
    std::string description;
    int type = 0; // the number of the ID3v2 APIC frame
    int width = 0;
    int height = 0; // in pixels; 0 if unknown
};

struct SWholeTag {
    std::vector<std::pair<std::string, std::vector<std::string>>> fields; // names and values, sorted by name
    std::vector<std::string> others;                                      // names of data without a text form
    std::vector<STagPicture> pictures;

    std::string getFirst(const std::string& name) const; // empty if there is no such field
};

// Throws std::runtime_error if the tag cannot be read.
SWholeTag readWholeTag(const std::filesystem::path& file);

// The fields of getTagFields() by their names on the command line, in UTF-8. Throws std::runtime_error if the
// tag cannot be read or the file cannot have one.
using TagTexts = std::map<std::string, std::string>;
TagTexts readTagTexts(CLibrary& library, const std::filesystem::path& file);

// Changes to make to a file at once. Functions throw std::runtime_error.
class CTagChange {
public:
    CTagChange();

    // Further calls with the same name add values; the empty value removes the field.
    void setField(const std::string& name, const std::string& value);
    void removePictures(int type); // -1: of all types
    void addPicture(const STagPicture& picture);
    // Returns whether the file was changed; one that is like that already is not written. On failure it is
    // unchanged.
    bool apply(const std::filesystem::path& file) const;

private:
    CHandle m_change;
};

// Has the change set a field of getTagFields().
void setTagText(CTagChange& change, const std::filesystem::path& file, const std::string& name,
                const std::string& text);

// Of picture types: "front", "back", ...
std::string getPictureTypeName(int type);
const std::map<std::string, int>& getPictureTypes();

} // namespace host
