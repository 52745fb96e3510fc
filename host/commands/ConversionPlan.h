// Which files a conversion writes.
#pragma once

#include "commands/Convert.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

struct SConversion {
    std::filesystem::path input;
    std::filesystem::path output;
    std::string problem; // why it cannot begin; normally empty
};

// One conversion per input file, in their order. An output that is one of the inputs is a problem, and so is
// an output that an earlier input of the list already has. Nothing is created.
std::vector<SConversion> planConversions(CLibrary& library, const SConvertOptions& options);

// Whether the outputs' folders are created. The folder of a single output must exist.
bool createsFolders(const SConvertOptions& options);

// The reason why the conversion could not begin, including those of planConversions(), as far as it is
// visible without reading the sound; otherwise empty. Nothing is created.
std::string findProblem(const SConversion& conversion, const SConvertOptions& options);

} // namespace host
