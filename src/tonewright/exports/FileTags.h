// Between the exports and the tag library, which is loaded on first use.
#pragma once

#include "peru/strings/String.h"

namespace tonewright::exports {

// For the tags that are created from now on. Any thread.
void setTagTempExtension(const peru::P<peru::IString>& extension);

} // namespace tonewright::exports
