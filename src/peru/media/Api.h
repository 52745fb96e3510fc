// Marks the exports of libperu_media. Everything is compiled with hidden visibility.
#pragma once

#define PERU_MEDIA_API __attribute__((visibility("default")))
