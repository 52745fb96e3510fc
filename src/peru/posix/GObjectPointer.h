// Owners of what GIO hands out.
#pragma once

#include <gio/gio.h>
#include <memory>

namespace peru::posix {

struct SGObjectRelease {
    void operator()(void* object) const { g_object_unref(object); }
};
template <class T> using TGObject = std::unique_ptr<T, SGObjectRelease>;

struct SGMemoryRelease {
    void operator()(void* memory) const { g_free(memory); }
};
using CGText = std::unique_ptr<char, SGMemoryRelease>;

struct SGErrorRelease {
    void operator()(GError* error) const { g_error_free(error); }
};
using CGError = std::unique_ptr<GError, SGErrorRelease>;

} // namespace peru::posix
