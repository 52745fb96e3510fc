// Marks what leaves libsonora2.
#pragma once

#define SONORA2_API __attribute__((visibility("default")))
