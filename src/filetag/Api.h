// Export macro of libfiletag. Everything else is compiled with hidden visibility.
#pragma once

#define FILETAG_API __attribute__((visibility("default")))
