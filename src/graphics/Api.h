// Export macro of tonewright_covereditor. Everything else is compiled with hidden visibility.
#pragma once

#define GRAPHICS_API __attribute__((visibility("default")))
