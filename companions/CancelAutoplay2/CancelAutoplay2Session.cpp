// Usage: CancelAutoplay2Session PID dummy. Keeps the desktop session from mounting media automatically while
// the process PID is running. Without a session, or if it does not respond, it only waits for that process.
#include <cerrno>
#include <csignal>
#include <cstdlib>

#include <gio/gio.h>
#include <glib-unix.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

constexpr guint32 kInhibitAutoMount = 16;
constexpr int kAnswerTimeout = 5000; // milliseconds

// The address of the session bus, or null if there is none. Asking GIO for the bus would start one.
gchar* findSessionBus() {
    if (const char* address = g_getenv("DBUS_SESSION_BUS_ADDRESS"); address && *address)
        return g_strdup(address);
    gchar* socket = g_build_filename(g_get_user_runtime_dir(), "bus", nullptr);
    gchar* address =
        g_file_test(socket, G_FILE_TEST_EXISTS) ? g_strconcat("unix:path=", socket, nullptr) : nullptr;
    g_free(socket);
    return address;
}

// The inhibition lasts as long as the connection, that is, until this process ends.
void onConnected(GObject*, GAsyncResult* result, gpointer) {
    GDBusConnection* bus = g_dbus_connection_new_for_address_finish(result, nullptr);
    if (!bus) return;
    g_dbus_connection_set_exit_on_close(bus, FALSE);
    g_dbus_connection_call(
        bus, "org.gnome.SessionManager", "/org/gnome/SessionManager", "org.gnome.SessionManager", "Inhibit",
        g_variant_new("(susu)", "CancelAutoplay2", guint32{0}, "Discs are in use by the audio suite",
                      kInhibitAutoMount),
        G_VARIANT_TYPE("(u)"), G_DBUS_CALL_FLAGS_NO_AUTO_START, kAnswerTimeout, nullptr, nullptr, nullptr);
}

gboolean onParentEnded(gint, GIOCondition, gpointer loop) {
    g_main_loop_quit(static_cast<GMainLoop*>(loop));
    return G_SOURCE_REMOVE;
}

struct SWatch {
    pid_t parent;
    GMainLoop* loop;
};

// For kernels without process file descriptors.
gboolean lookForParent(gpointer data) {
    auto* watch = static_cast<SWatch*>(data);
    if (kill(watch->parent, 0) == 0 || errno != ESRCH) return G_SOURCE_CONTINUE;
    g_main_loop_quit(watch->loop);
    return G_SOURCE_REMOVE;
}

} // namespace

int main(int argc, char** argv) {
    char* end = nullptr;
    const long parent = argc > 1 ? std::strtol(argv[1], &end, 10) : 0;
    if (parent <= 0 || *end != '\0') {
        g_printerr("usage: CancelAutoplay2Session PROCESS-ID dummy\n");
        return 2;
    }

    const auto id = static_cast<pid_t>(parent);
    const int process = static_cast<int>(syscall(SYS_pidfd_open, id, 0));
    if (process < 0 && errno == ESRCH) return 0;
    GMainLoop* loop = g_main_loop_new(nullptr, FALSE);
    SWatch watch{id, loop};
    if (process >= 0)
        g_unix_fd_add(process, G_IO_IN, onParentEnded, loop);
    else
        g_timeout_add_seconds(1, lookForParent, &watch);

    if (gchar* address = findSessionBus()) {
        g_dbus_connection_new_for_address(
            address,
            static_cast<GDBusConnectionFlags>(G_DBUS_CONNECTION_FLAGS_AUTHENTICATION_CLIENT |
                                              G_DBUS_CONNECTION_FLAGS_MESSAGE_BUS_CONNECTION),
            nullptr, nullptr, onConnected, nullptr);
        g_free(address);
    }
    g_main_loop_run(loop);
    g_main_loop_unref(loop);
    return 0;
}
