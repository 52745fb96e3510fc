#include "peru/desktop/posix/GObjectPointer.h"

#include <gio/gio.h>

namespace peru::posix {

void SGObjectRelease::operator()(void* object) const {
    g_object_unref(object);
}

void SGMemoryRelease::operator()(void* memory) const {
    g_free(memory);
}

void SGErrorRelease::operator()(GError* error) const {
    g_error_free(error);
}

} // namespace peru::posix
