#include "peru/system/posix/DynamicLibraryLoader.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"

#include <dlfcn.h>
#include <string>

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

P<IDynamicLibrary> open(const std::string& name) {
    // An empty name would return the program itself.
    void* handle = name.empty() ? nullptr : dlopen(name.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle) return make<CDynamicLibrary>(handle);
    const char* reason = name.empty() ? "no name was given" : dlerror();
    throw CError(localize("peru.CDynamicLibraryLoader.loadError",
                          "Error loading library '%FILE%' (%ERRORDESC%).",
                          {{"%FILE%", CString::fromUTF8(name)},
                           {"%ERRORDESC%", CString::fromUTF8(reason ? reason : "unknown reason")}}));
}

} // namespace

P<IDynamicLibrary> CDynamicLibraryLoader::load(const P<IURI>& file) {
    std::string path = toPath(file);
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
