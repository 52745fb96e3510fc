#include "sonora2_slave/sandbox/JobAccess.h"

namespace slave {

namespace {

namespace fs = std::filesystem;

constexpr int kMostLinks = 40; // as many as the kernel follows

// Formats of more than one file: they have the same name and these extensions.
constexpr const char* kTwins[][2] = {{".idx", ".sub"}};

// The file at the end of links, which need not exist.
fs::path followLinks(fs::path path) {
    std::error_code error;
    for (int i = 0; i < kMostLinks; ++i) {
        const fs::path next = fs::read_symlink(path, error);
        if (error) break;
        path = next.is_absolute() ? next : path.parent_path() / next;
    }
    return path;
}

} // namespace

SSandbox allowReading(const fs::path& medium) {
    SSandbox sandbox;
    sandbox.readable = {medium};
    for (const auto& [first, second] : kTwins) {
        const fs::path extension = medium.extension();
        if (extension == first) sandbox.readable.push_back(fs::path(medium).replace_extension(second));
        if (extension == second) sandbox.readable.push_back(fs::path(medium).replace_extension(first));
    }
    return sandbox;
}

SSandbox allowWriting(const fs::path& target) {
    SSandbox sandbox;
    std::error_code error;
    const fs::file_status status = fs::status(target, error);
    const bool isFile = !fs::exists(status) || fs::is_regular_file(status);
    const fs::path folder = followLinks(target).parent_path();
    sandbox.writable = {isFile ? (folder.empty() ? fs::path(".") : folder) : target};
    return sandbox;
}

} // namespace slave
