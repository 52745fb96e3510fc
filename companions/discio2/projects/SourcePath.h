// Where the contents of a project come from.
#pragma once

#include <string>

namespace discio {

// The path of a file from an absolute path, one with "\" in place of every "/", or a file URI of this
// machine. Throws CDiscError for anything else.
std::string toSourcePath(const std::string& text);
// The URI of an absolute path, with %XX for every byte that is not allowed in a path.
std::string toFileURI(const std::string& path);

} // namespace discio
