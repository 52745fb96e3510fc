#include "peru/desktop/posix/FileTypesManager.h"
#include "peru/desktop/posix/GObjectPointer.h"
#include "peru/system/IDesktop.h"

#include <gio/gio.h>

namespace peru::posix {

namespace {

std::string toString(const CGText& text) {
    return text ? text.get() : "";
}

class CDesktop : public CObject, public IDesktop {
public:
    P<IFileTypesManager> createFileTypesManager() override { return make<CFileTypesManager>(); }
    std::string findKind(const std::string& path) override {
        const CGText type(g_content_type_guess(path.c_str(), nullptr, 0, nullptr));
        return toString(CGText(g_content_type_get_mime_type(type.get())));
    }
    bool moveToTrash(const std::string& path, int& code) override {
        const TGObject<GFile> file(g_file_new_for_path(path.c_str()));
        GError* error = nullptr;
        if (g_file_trash(file.get(), nullptr, &error)) return true;
        code = CGError(error)->code;
        return false;
    }
    std::vector<std::string> findProxies(const std::string& uri) override {
        GProxyResolver* resolver = g_proxy_resolver_get_default();
        char** found = resolver ? g_proxy_resolver_lookup(resolver, uri.c_str(), nullptr, nullptr) : nullptr;
        std::vector<std::string> proxies;
        for (char** entry = found; entry && *entry; ++entry) proxies.emplace_back(*entry);
        g_strfreev(found);
        return proxies;
    }
    std::string toASCIIHost(const std::string& host) override {
        if (!g_utf8_validate(host.c_str(), -1, nullptr)) return {};
        return toString(CGText(g_hostname_to_ascii(host.c_str())));
    }

protected:
    ~CDesktop() override = default;
};

} // namespace

} // namespace peru::posix

extern "C" PERU_API void peru_getDesktop(peru::P<peru::IDesktop>& desktop) {
    desktop = peru::make<peru::posix::CDesktop>();
}
