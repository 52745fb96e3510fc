// Export macro of libdisciopp. Everything else is compiled with hidden visibility.
#pragma once

#define DISCIOPP_API __attribute__((visibility("default")))
