// tonewright get
#pragma once

#include "terminal/Progress.h"

#include <filesystem>
#include <string>

namespace host {

struct SGetOptions {
    std::string address;
    std::filesystem::path output; // empty: the name in the address, in the current folder
    bool force = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int getFile(const SGetOptions& options);

} // namespace host
