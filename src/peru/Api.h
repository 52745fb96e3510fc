// PERU_API exports a symbol from libperu; everything else is compiled with hidden visibility.
#pragma once

#define PERU_API __attribute__((visibility("default")))
