// The language of the library's messages.
#pragma once

#include "zvr_lang_manager/LanguageId.h"

namespace tonewright {

// Replaces the texts of all messages from now on. Language files are searched in the folder "Lang" beside the
// libraries and in share/tonewright/Lang of an installation; those in the folders of TONEWRIGHT_LANG_PATH, a
// list separated by ":", take precedence, the first one most. The folders are listed on the first call only.
// Texts without a translation are English. Not thread-safe; other threads may log and fail meanwhile.
void applyLanguage(const zvr_lang::SLanguageId& id);

} // namespace tonewright
