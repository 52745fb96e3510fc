#include "peru/system/posix/DynamicLibraryLoader.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"

#include <dlfcn.h>
#include <string>
#include <sys/stat.h>

namespace peru::posix {

namespace {

class CDynamicLibrary : public CObject, public IDynamicLibrary {
public:
    explicit CDynamicLibrary(void* handle) : m_handle(handle) {}
    ~CDynamicLibrary() override { dlclose(m_handle); }
    CDynamicLibrary(const CDynamicLibrary&) = delete;
    CDynamicLibrary& operator=(const CDynamicLibrary&) = delete;

    void* findSymbol(const char* name) override { return dlsym(m_handle, name); }

private:
    void* m_handle;
};

[[noreturn]] void raise(const std::string& name, const char* reason) {
    throw CError(localize("peru.CDynamicLibraryLoader.loadError",
                          "Error loading library '%FILE%' (%ERRORDESC%).",
                          {{"%FILE%", CString::fromUTF8(name)},
                           {"%ERRORDESC%", CString::fromUTF8(reason ? reason : "unknown reason")}}));
}

P<IDynamicLibrary> open(const std::string& name) {
    // An empty name would return the program itself.
    if (name.empty()) raise(name, "no name was given");
    if (void* handle = dlopen(name.c_str(), RTLD_NOW | RTLD_LOCAL)) return make<CDynamicLibrary>(handle);
    raise(name, dlerror());
}

} // namespace

P<IDynamicLibrary> CDynamicLibraryLoader::load(const P<IURI>& file) {
    std::string path = toPath(file);
    // The loader would wait for the other end of a FIFO.
    struct stat status;
    if (::stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode)) raise(path, "not a regular file");
    // Without a slash the loader would use its search path.
    return open(path.find('/') == std::string::npos ? "./" + path : path);
}

P<IDynamicLibrary> CDynamicLibraryLoader::loadByName(const CStringArg& name) {
    return open(CString::toStdString(name));
}

} // namespace peru::posix

namespace peru {

P<IDynamicLibraryLoader> getDynamicLibraryLoader() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IDynamicLibraryLoader>(
        key, [] { return P<IDynamicLibraryLoader>(make<posix::CDynamicLibraryLoader>()); });
}

} // namespace peru
