// Patterns of file names, such as "%artist%/%album%/%track% %title%".
#pragma once

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace host {

class CNamePattern {
public:
    // UTF-8 texts by the name of the field, without percent signs.
    using Fields = std::map<std::string, std::string>;

    // Throws std::invalid_argument, with a message that lists the known fields, if the text has another
    // field, a single percent sign or no field at all, or if it does not describe a relative path below a
    // folder.
    explicit CNamePattern(const std::string& text);

    // "%artist%, %album%, ...", for messages and help.
    static std::string describeFields();

    // A relative path that ends in the extension (".flac"). No field can add a folder or leave the current
    // one: slashes in texts become hyphens and control characters become spaces. Parts of the path have no
    // dots at the start, no dots or spaces at the end, and at most 255 bytes with the extension, cut between
    // characters. A missing title is replaced by the field "name", a missing album artist by the artist, and
    // others by "Unknown Artist" and so on; a missing comment stays empty. Track "3/12" becomes "03", and
    // year "1999-04-01" becomes "1999".
    std::filesystem::path expand(const Fields& fields, const std::string& extension) const;

    // Whether match() is unambiguous: between two fields of free text there is other text.
    bool canMatch() const;

    // The fields of a file with that name, from as many of its folders as the pattern has; the extension is
    // ignored. Track numbers consist of digits and lose leading zeros, and years have four digits. Where
    // several divisions are possible, the fields in front are as short as possible. "name" matches any text
    // and is not returned. Empty if the name does not match, or if a field occurs twice with different texts.
    std::optional<Fields> match(const std::filesystem::path& file) const;

private:
    struct SPiece {
        bool isField;
        std::string text; // the name of the field, or literal text
    };
    using Part = std::vector<SPiece>; // of the path, between slashes

    std::vector<Part> m_parts;
};

} // namespace host
