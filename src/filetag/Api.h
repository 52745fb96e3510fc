// Marks what leaves libfiletag. Everything is compiled with hidden visibility.
#pragma once

#define FILETAG_API __attribute__((visibility("default")))
