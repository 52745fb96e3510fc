// Settings of boxed plug-ins, stored as parameters of the context.
#pragma once

#include "sonora2/context/ISonoraContext.h"

#include <cstdint>

namespace sonora2::common {

constexpr uint32_t kBoxedParameterKey = 2;
// Names of the plug-ins that run in a process of their own, separated by commas and with or without their
// "sonora2_", or "all". Used when a plug-in handler loads its plug-ins.
constexpr const char* kBoxedPluginsParameter = "plugins";
// Milliseconds that one call into a slave may take before the slave counts as hanging and is killed. 0 means
// without limit; if empty, the default.
constexpr const char* kBoxedDeadlineParameter = "deadline";
constexpr uint32_t kBoxedDeadline = 30'000;
// So many times as long may closing a format take, which waits for its file to reach the disk.
constexpr uint32_t kCloseDeadlineFactor = 10;
// MiB that a slave may use in addition to its libraries; 0 means without limit; if empty, the default.
constexpr const char* kBoxedMemoryParameter = "memory";
constexpr uint32_t kBoxedMemory = 1024;
// Bytes that one answer of a slave may have, and one text in it. The largest legitimate ones are pictures.
constexpr int64_t kLargestAnswer = int64_t{512} << 20;
constexpr int32_t kLongestAnswerText = 16 << 20;
// Set once a slave has had the opportunity to log what the kernel lacks for its sandbox.
constexpr const char* kBoxedWarnedParameter = "warned";
// Followed by a plug-in's name: the URI of its library. The slave searches for the library without it.
constexpr const char* kBoxedLibraryParameter = "library:";

SONORA2_API uint32_t getBoxedDeadline(const P<ISonoraContext>& context); // milliseconds
SONORA2_API uint32_t getBoxedMemory(const P<ISonoraContext>& context);   // MiB
// Whether the context's list contains the plug-in.
SONORA2_API bool isBoxedPlugin(const P<ISonoraContext>& context, const peru::CStringArg& name);

} // namespace sonora2::common
