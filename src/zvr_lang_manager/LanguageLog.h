// The log lines that packs and their manager share.
#pragma once

#include "peru/uri/IURI.h"

#include <exception>

namespace zvr_lang {

// The component of the lines.
inline constexpr const char* kLogComponent = "zvr_lang::manager";

void logLoadError(const peru::P<peru::IURI>& uri, const std::exception& error);

} // namespace zvr_lang
