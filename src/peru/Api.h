// Marks what leaves libperu. Everything is compiled with hidden visibility.
#pragma once

#define PERU_API __attribute__((visibility("default")))
