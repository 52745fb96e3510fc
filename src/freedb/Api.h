// Export macro of libfreedb. Everything else is compiled with hidden visibility.
#pragma once

#define FREEDB_API __attribute__((visibility("default")))
