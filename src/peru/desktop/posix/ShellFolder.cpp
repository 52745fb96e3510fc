#include "peru/desktop/posix/ShellFolder.h"

#include "peru/Errors.h"
#include "peru/files/posix/FileTimes.h"
#include "peru/posix/PlatformFile.h"
#include "peru/uri/URI.h"

#include <gio/gio.h>

namespace peru::posix {
namespace {

constexpr const char* kAttributes = "standard::*,time::*,access::can-write,access::can-execute,unix::mode";
constexpr const char* kItemError = "Error obtaining shell folder item information.";
constexpr const char* kEnumerateError = "Error enumerating shell folder contents.";

P<IString> toText(const char* utf8) {
    return utf8 ? CString::fromUTF8(utf8) : CString::empty();
}

P<IURI> toURI(GFile* file) {
    // Local files keep their bytes this way; GIO's own URI text may escape more than ours.
    CGText path(g_file_get_path(file));
    if (path) return posix::toURI(path.get());
    CGText text(g_file_get_uri(file));
    return make<CURI>(CString::fromUTF8(text.get()));
}

TGObject<GFile> toFile(const P<IURI>& uri) {
    std::string path = tryToPath(uri);
    if (!path.empty()) return TGObject<GFile>(g_file_new_for_path(path.c_str()));
    if (!uri || uri->isRelative()) throw CFileError("Error obtaining ITEMIDLIST from path or name:", uri);
    return TGObject<GFile>(g_file_new_for_uri(CString::toStdString(uri->getAsString()).c_str()));
}

TGObject<GFileInfo> query(GFile* file, const char* message) {
    GError* error = nullptr;
    TGObject<GFileInfo> info(g_file_query_info(file, kAttributes, G_FILE_QUERY_INFO_NONE, nullptr, &error));
    CGError owner(error);
    if (!info) throw CFileError(message, toURI(file));
    return info;
}

TGObject<GFile> getChild(GFile* folder, const CStringArg& name) {
    return TGObject<GFile>(g_file_get_child(folder, CString::toStdString(name).c_str()));
}

timespec getTime(GFileInfo* info, const char* seconds, const char* microseconds) {
    timespec time{};
    time.tv_sec = static_cast<time_t>(g_file_info_get_attribute_uint64(info, seconds));
    time.tv_nsec = static_cast<long>(g_file_info_get_attribute_uint32(info, microseconds)) * 1000;
    return time;
}

SFileAttributes toAttributes(GFileInfo* info, bool file) {
    SFileAttributes attributes;
    attributes.hidden = g_file_info_get_is_hidden(info);
    attributes.link = g_file_info_get_is_symlink(info);
    attributes.readOnly = g_file_info_has_attribute(info, G_FILE_ATTRIBUTE_ACCESS_CAN_WRITE) &&
                          !g_file_info_get_attribute_boolean(info, G_FILE_ATTRIBUTE_ACCESS_CAN_WRITE);
    attributes.executable =
        file && g_file_info_get_attribute_boolean(info, G_FILE_ATTRIBUTE_ACCESS_CAN_EXECUTE);
    return attributes;
}

} // namespace

// --- CShellFolder ---

P<CShellFolder> CShellFolder::bind(const P<IURI>& uri) {
    TGObject<GFile> file = toFile(uri);
    TGObject<GFileInfo> info = query(file.get(), "Error binding to shell folder.");
    GFileType type = g_file_info_get_file_type(info.get());
    if (type != G_FILE_TYPE_DIRECTORY && type != G_FILE_TYPE_MOUNTABLE)
        throw CFileError("Error binding to shell folder.", uri);
    return make<CShellFolder>(std::move(file));
}

P<IURI> CShellFolder::getURI() {
    return toURI(m_file.get());
}

P<IFileObjectCursor> CShellFolder::enumerate() {
    return CShellFolderCursor::open(m_file.get());
}

P<IString> CShellFolder::getItemName(const CStringArg& name) {
    TGObject<GFile> item = getChild(m_file.get(), name);
    return toText(g_file_info_get_display_name(query(item.get(), kItemError).get()));
}

SFileAttributes CShellFolder::getItemAttributes(const CStringArg& name) {
    TGObject<GFile> item = getChild(m_file.get(), name);
    TGObject<GFileInfo> info = query(item.get(), kItemError);
    return toAttributes(info.get(), g_file_info_get_file_type(info.get()) == G_FILE_TYPE_REGULAR);
}

// --- CShellFileObject ---

P<CShellFileObject> CShellFileObject::find(const P<IURI>& uri) {
    TGObject<GFile> file = toFile(uri);
    TGObject<GFileInfo> info = query(file.get(), kItemError);
    return make<CShellFileObject>(std::move(file), std::move(info));
}

CShellFileObject::CShellFileObject(TGObject<GFile> file, TGObject<GFileInfo> info)
    : m_file(std::move(file)), m_info(std::move(info)) {}

CShellFileObject::~CShellFileObject() = default;

P<IURI> CShellFileObject::getURI() {
    CGText path(g_file_get_path(m_file.get()));
    return isFolder() && path ? toFolderURI(path.get()) : toURI(m_file.get());
}

P<IString> CShellFileObject::getName() {
    return toText(g_file_info_get_name(m_info.get()));
}

P<IString> CShellFileObject::getDisplayName() {
    return toText(g_file_info_get_display_name(m_info.get()));
}

bool CShellFileObject::isFile() {
    return g_file_info_get_file_type(m_info.get()) == G_FILE_TYPE_REGULAR;
}

bool CShellFileObject::isFolder() {
    return g_file_info_get_file_type(m_info.get()) == G_FILE_TYPE_DIRECTORY;
}

int64_t CShellFileObject::getSize() {
    return isFile() ? g_file_info_get_size(m_info.get()) : 0;
}

P<peru::CFileTimes> CShellFileObject::getTimes() {
    GFileInfo* info = m_info.get();
    timespec creation = getTime(info, G_FILE_ATTRIBUTE_TIME_CREATED, G_FILE_ATTRIBUTE_TIME_CREATED_USEC);
    bool known = g_file_info_has_attribute(info, G_FILE_ATTRIBUTE_TIME_CREATED);
    return make<CFileTimes>(
        known ? &creation : nullptr,
        getTime(info, G_FILE_ATTRIBUTE_TIME_ACCESS, G_FILE_ATTRIBUTE_TIME_ACCESS_USEC),
        getTime(info, G_FILE_ATTRIBUTE_TIME_MODIFIED, G_FILE_ATTRIBUTE_TIME_MODIFIED_USEC));
}

SFileAttributes CShellFileObject::getAttributes() {
    return toAttributes(m_info.get(), isFile());
}

P<IString> CShellFileObject::getKind() {
    const char* type = g_file_info_get_content_type(m_info.get());
    CGText mime(type ? g_content_type_get_mime_type(type) : nullptr);
    return toText(mime.get());
}

P<IString> CShellFileObject::getKindDescription() {
    const char* type = g_file_info_get_content_type(m_info.get());
    CGText description(type ? g_content_type_get_description(type) : nullptr);
    return toText(description.get());
}

P<IString> CShellFileObject::getIconName() {
    GIcon* icon = g_file_info_get_icon(m_info.get());
    if (!icon || !G_IS_THEMED_ICON(icon)) return CString::empty();
    const char* const* names = g_themed_icon_get_names(G_THEMED_ICON(icon));
    return toText(names ? names[0] : nullptr);
}

P<IFileObjectCursor> CShellFileObject::enumerate() {
    return CShellFolderCursor::open(m_file.get());
}

// --- CShellFolderCursor ---

CShellFolderCursor::CShellFolderCursor(GFile* folder) : m_folder(G_FILE(g_object_ref(folder))) {
    reset();
}

P<IFileObjectCursor> CShellFolderCursor::open(GFile* folder) {
    return make<CShellFolderCursor>(folder);
}

void CShellFolderCursor::reset() {
    GError* error = nullptr;
    m_current = nullptr;
    m_items.reset(
        g_file_enumerate_children(m_folder.get(), kAttributes, G_FILE_QUERY_INFO_NONE, nullptr, &error));
    CGError owner(error);
    if (!m_items) throw CFileError(kEnumerateError, toURI(m_folder.get()));
}

bool CShellFolderCursor::next() {
    GError* error = nullptr;
    m_current = nullptr;
    TGObject<GFileInfo> info(g_file_enumerator_next_file(m_items.get(), nullptr, &error));
    CGError owner(error);
    if (error) throw CFileError(kEnumerateError, toURI(m_folder.get()));
    if (!info) return false;
    TGObject<GFile> child(g_file_get_child(m_folder.get(), g_file_info_get_name(info.get())));
    m_current = make<CShellFileObject>(std::move(child), std::move(info));
    return true;
}

P<IFileObject> CShellFolderCursor::getFileObject() {
    if (!m_current) throw CInvalidObjectStateError("no item under the cursor", P<IBase>::share(this));
    return m_current;
}

// --- CDesktopFileObject ---

P<CDesktopFileObject> CDesktopFileObject::get() {
    const char* desktop = g_get_user_special_dir(G_USER_DIRECTORY_DESKTOP);
    bool there = desktop && g_file_test(desktop, G_FILE_TEST_IS_DIR);
    TGObject<GFile> file(g_file_new_for_path(there ? desktop : g_get_home_dir()));
    TGObject<GFileInfo> info = query(file.get(), "Error obtaining information about the shell's root item.");
    return make<CDesktopFileObject>(std::move(file), std::move(info));
}

} // namespace peru::posix
