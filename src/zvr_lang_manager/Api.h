// Marks the exports of libzvr_lang.
#pragma once

#define ZVR_LANG_API __attribute__((visibility("default")))
